#pragma once

#include <functional>
#include <string>
#include <string_view>

/// Severities of the log, as the system log counts them. Error lines go to standard error; debug lines only
/// when QELVAR_LOG=debug is set. Any thread.
enum class VSLogLevel { Error = 3, Debug = 7 };

bool VSLogIsEnabled(VSLogLevel level);
void VSLog(VSLogLevel level, std::string_view line);
/// Replaces the sink (tests) and returns the one before (null: the default). A null sink restores the
/// default. Any other sink gets the lines of all levels, on the thread that logs.
using VSLogSink = std::function<void(VSLogLevel, std::string_view)>;
VSLogSink VSSetLogSink(VSLogSink sink);
