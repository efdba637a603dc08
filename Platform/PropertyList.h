#pragma once

#include <functional>
#include <string_view>

#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSValue.h"

namespace platform {

/// Reads an XML property list: `dict`, `array`, `key`, `string`, `integer`, `real`, `date`, `true`, `false`,
/// `data`. Strict: anything else, a key given twice, a number or date that is not one, entity declarations,
/// more than one value at the top and text between elements are Invalid, with the line. Any thread.
VSResult<VSValue> readPropertyList(std::string_view document);

/// The same for a document whose top is a dictionary, up to its entry `key`, which is not read: what stands
/// before a long list. All entries when there is no such key.
VSResult<VSValue::Dictionary> readPropertyListBefore(std::string_view document, std::string_view key);

}  // namespace platform
