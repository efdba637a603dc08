#pragma once

class QQuickView;

/// How long the start takes, for whoever sets QELVAR_TRACE_STARTUP: lines on standard error with the
/// milliseconds since the process was started. Costs nothing otherwise. Main thread only.
namespace QVStartupTrace {

void note(const char* what);
/// Notes when the first frame is shown, and when all cards that can be seen have been painted with their
/// data.
void watch(QQuickView& window);

}  // namespace QVStartupTrace
