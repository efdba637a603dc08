#pragma once

#include <functional>

namespace test {

/// Runs the event loop until the condition holds; false when it does not within a minute.
bool waitUntil(const std::function<bool()>& condition);

}  // namespace test
