#pragma once

#include "Qelvar/DataProviders/QVDataProvider.h"

/// What the providers of single readings share: the current value is the most recent sample itself, dated at
/// its last moment.
class QVMostRecentSampleDataProvider : public QVDataProvider {
 public:
    using QVDataProvider::QVDataProvider;
    void stopQueries() override;

 protected:
    /// What the log says when the observer, respectively the look-up that it causes, fails.
    struct CurrentValueLogs {
        const char* observer;
        const char* lookUp;
    };
    virtual CurrentValueLogs currentValueLogs() const = 0;
    /// Asks, unless the current value is loaded.
    void restartCurrentValueQueryIfNeeded();

 private:
    void updateMostRecentObject(const Error& error);
    QVRunningQuery currentValueQuery_;
};
