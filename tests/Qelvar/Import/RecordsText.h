#pragma once

#include <memory>
#include <string>

#include "Qelvar/Import/QVImportReport.h"
#include "Vessa/Base/VSError.h"
#include "Vessa/VSHealthStore.h"

namespace test {

/// What an import told, as lines of text.
std::string textOfReport(const VSResult<QVImportReport>& report);
/// All that a store holds, as lines of text in an order of their own: types by code, records by start.
std::string textOfStore(VSHealthStore& store);

}  // namespace test
