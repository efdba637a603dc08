#include "Qelvar/App/QVTransferController.h"

#include <cmath>

#include "Platform/Localization.h"
#include "Qelvar/Formatters/QVNumberFormatters.h"

QString QVTransferController::progressText() const {
    const double done = fraction();
    if (done < 0 || !isWorking()) return {};
    return platform::localized(
        "TRANSFER_PERCENT",
        {QVNumberFormatterWithFractionDigits(0)->stringFromNumber(std::floor(100 * done))});
}

QString QVTransferController::statusText() const {
    const QString progress = progressText();
    return progress.isEmpty() ? title() : title() + QStringLiteral(", ") + progress;
}

void QVTransferController::setAside(bool aside) {
    if (aside_ == aside || !isThere()) return;
    aside_ = aside;
    emit changed();
}
