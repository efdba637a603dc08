#pragma once

#include <gtest/gtest.h>

#include <stdexcept>

#include "QtTestSupport.h"
#include "TestSupport.h"
#include "VessaUI/VSUnitController.h"

namespace test {

/// A store on disk, an English (US) environment and the user's units.
class FormattersTest : public testing::Test {
 protected:
    FormattersTest() {
        auto store = VSHealthStore::open(folder_.path() / "store");
        if (!store.ok()) throw std::runtime_error(store.error().message);
        store_ = store.value();
        units_ = std::make_unique<VSUnitController>(store_);
    }

    static const VSDataUnitGroup* group(int id) {
        return VSDataUnitGroupController::shared().dataUnitGroupWithID(id);
    }
    const VSDataUnitGroup* groupForType(VSTypeCode code) const {
        return VSDataUnitGroupController::shared().dataUnitGroupForType(VSObjectType::dataTypeWithCode(code));
    }
    void setUnit(const VSDataUnitGroup* type, const char* unit) {
        units_->updatePreferredUnit(VSUnit::fromString(unit), type->anyDataUnit());
    }

    FixedEnvironment environment_{"2020-03-31T20:00", "Europe/Copenhagen", "en_US"};
    TemporaryFolder folder_;
    std::shared_ptr<VSHealthStore> store_;
    std::unique_ptr<VSUnitController> units_;
};

}  // namespace test
