#pragma once

#include <filesystem>
#include <functional>

/// What a part of a benchmark took.
struct Cost {
    double seconds = 0, processorSeconds = 0, megabytes = 0;
};

/// Runs the work in a process of its own, so that its memory can be told.
Cost costOf(const std::function<void()>& work);
void print(const char* what, const Cost& cost);

/// An archive of two years of a wrist: heart rate every 72 seconds, steps and distance every five minutes.
void makeRecordsArchive(const std::filesystem::path& file);
void importRecords(const std::filesystem::path& file, const std::filesystem::path& store);
