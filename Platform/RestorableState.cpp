#include "Platform/RestorableState.h"

namespace platform {

std::string RestorableObjects::identifierOf(const void* object) const {
    for (const auto& [identifier, entry] : objects_)
        if (entry.first == object) return identifier;
    return {};
}

const VSValue* RestorableState::value(const std::string& key) const {
    const auto found = values_.find(key);
    return found == values_.end() ? nullptr : &found->second;
}

std::optional<int64_t> RestorableState::integer(const std::string& key) const {
    const VSValue* found = value(key);
    return found ? found->integer() : std::nullopt;
}

void RestorableState::setObject(const std::string& key, const void* object) {
    if (const std::string identifier = objects_.identifierOf(object); !identifier.empty())
        set(key, identifier);
}

}  // namespace platform
