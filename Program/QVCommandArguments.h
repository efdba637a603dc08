#pragma once

#include <map>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "Vessa/Base/VSError.h"

/// An option of a command line.
struct QVCommandOption {
    std::string_view name;  // "store" for --store
    bool takesValue = false;
};

/// A command line taken apart: "--name value", "--name=value", "--flag", and what is no option. After "--"
/// nothing is.
class QVCommandArguments {
 public:
    /// Invalid: an unknown option, a value that is missing or not wanted. With `stopAtFirstWord` everything
    /// from the first word that is no option on is left alone, as words.
    static VSResult<QVCommandArguments> parse(std::span<const std::string> arguments,
                                              std::span<const QVCommandOption> options,
                                              bool stopAtFirstWord = false);

    bool has(std::string_view name) const { return values_.contains(name); }
    /// The last value given.
    std::optional<std::string> value(std::string_view name) const;
    /// All values given, in order.
    std::vector<std::string> values(std::string_view name) const;
    const std::vector<std::string>& words() const { return words_; }

 private:
    std::multimap<std::string, std::string, std::less<>> values_;
    std::vector<std::string> words_;
};
