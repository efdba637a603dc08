#include "Program/QVCommandArguments.h"

#include <algorithm>

namespace {

VSError invalid(std::string message) {
    return VSError{VSErrorCode::Invalid, std::move(message)};
}

}  // namespace

VSResult<QVCommandArguments> QVCommandArguments::parse(std::span<const std::string> arguments,
                                                       std::span<const QVCommandOption> options,
                                                       bool stopAtFirstWord) {
    QVCommandArguments result;
    for (size_t i = 0; i < arguments.size(); ++i) {
        std::string_view argument = arguments[i];
        const bool isOption = argument.starts_with("-") && argument != "-";
        if (!isOption || argument == "--") {
            const size_t first = i + (isOption ? 1 : 0);
            if (!isOption && !stopAtFirstWord) {
                result.words_.emplace_back(argument);
                continue;
            }
            result.words_.insert(result.words_.end(), arguments.begin() + static_cast<std::ptrdiff_t>(first),
                                 arguments.end());
            return result;
        }
        const size_t equals = argument.find('=');
        const std::string_view name = argument.starts_with("--")
                                          ? argument.substr(2, equals == argument.npos ? equals : equals - 2)
                                          : argument;
        const auto option = std::find_if(options.begin(), options.end(),
                                         [&](const auto& known) { return known.name == name; });
        if (option == options.end())
            return invalid("unknown option " + std::string(argument.substr(0, equals)));
        std::string value;
        if (option->takesValue) {
            if (equals != argument.npos)
                value = argument.substr(equals + 1);
            else if (++i < arguments.size())
                value = arguments[i];
            else
                return invalid("the option --" + std::string(name) + " needs a value");
        } else if (equals != argument.npos) {
            return invalid("the option --" + std::string(name) + " takes no value");
        }
        result.values_.emplace(std::string(name), std::move(value));
    }
    return result;
}

std::optional<std::string> QVCommandArguments::value(std::string_view name) const {
    const auto [first, last] = values_.equal_range(name);
    return first == last ? std::nullopt : std::optional(std::prev(last)->second);
}

std::vector<std::string> QVCommandArguments::values(std::string_view name) const {
    std::vector<std::string> result;
    const auto [first, last] = values_.equal_range(name);
    for (auto entry = first; entry != last; ++entry) result.push_back(entry->second);
    return result;
}
