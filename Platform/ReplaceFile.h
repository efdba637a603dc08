#pragma once

#include <filesystem>
#include <string_view>

namespace platform {

/// Replaces a small private file as a whole: written beside it and renamed, so that a killed process leaves
/// the old or the new one. Makes its folder where there is none. `durable` waits until it outlives a lost
/// power supply; else that may leave an empty one. False, and errno says why, when it could not be written.
/// Any thread.
bool replaceFile(const std::filesystem::path& path, std::string_view text, bool durable);

}  // namespace platform
