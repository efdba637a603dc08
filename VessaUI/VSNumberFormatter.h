#pragma once

#include <QString>
#include <optional>

class VSDataUnit;
class VSUnitController;

/// Turns one number of one display unit into plain text. The number is in the user's preferred unit, as
/// shown.
class VSNumberFormatter {
 public:
    virtual ~VSNumberFormatter() = default;
    /// None: there is no text for this number. Main thread.
    virtual std::optional<QString> stringFromNumber(double number, const VSDataUnit* dataUnit,
                                                    const VSUnitController& unitController) const = 0;
};
