#pragma once

#include <any>
#include <map>
#include <memory>
#include <optional>
#include <string>

#include "Vessa/Base/VSValue.h"

namespace platform {

/// Objects that live as long as the process and which saved states refer to by name.
class RestorableObjects {
 public:
    template <typename Object>
    void add(const std::string& identifier, std::shared_ptr<Object> object) {
        objects_[identifier] = {object.get(), object};
    }
    /// Empty: it was not added.
    std::string identifierOf(const void* object) const;
    /// Null: there is none of that name and class.
    template <typename Object>
    std::shared_ptr<Object> object(const std::string& identifier) const {
        const auto found = objects_.find(identifier);
        const auto* object =
            found == objects_.end() ? nullptr : std::any_cast<std::shared_ptr<Object>>(&found->second.second);
        return object ? *object : nullptr;
    }

 private:
    std::map<std::string, std::pair<const void*, std::any>> objects_;
};

/// What a screen keeps for a later session: values by key, and references to registered objects.
class RestorableState {
 public:
    /// REQUIRES: `objects` outlives the state.
    explicit RestorableState(const RestorableObjects& objects, VSValue::Dictionary values = {})
        : objects_(objects), values_(std::move(values)) {}

    const VSValue::Dictionary& values() const { return values_; }
    void set(const std::string& key, VSValue value) { values_.insert_or_assign(key, std::move(value)); }
    /// Null: there is no such key.
    const VSValue* value(const std::string& key) const;
    /// None when there is no such key, or a value of another kind.
    std::optional<int64_t> integer(const std::string& key) const;

    /// Keeps the name under which the object is registered; nothing when it is not.
    void setObject(const std::string& key, const void* object);
    template <typename Object>
    std::shared_ptr<Object> object(const std::string& key) const {
        const VSValue* found = value(key);
        const std::string* name = found ? found->string() : nullptr;
        return name ? objects_.object<Object>(*name) : nullptr;
    }

 private:
    const RestorableObjects& objects_;
    VSValue::Dictionary values_;
};

}  // namespace platform
