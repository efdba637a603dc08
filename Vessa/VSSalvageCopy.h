#pragma once

#include <filesystem>

/// A private copy of a store's file with what its log and journal hold, for a salvage. The original is not
/// changed, and while it is copied no program can open it. Throws VSDatabaseFailure: NotAccessible where
/// there is none or another program has it open. REQUIRES: this process does not have it open.
void VSCopyForSalvage(const std::filesystem::path& file, const std::filesystem::path& copy);
