#include "Qelvar/Charts/QVAxisLabel.h"

#include "Vessa/Base/VSCalendar.h"

QString QVAxisLabel::description() const {
    return QStringLiteral("Text: %1, Location: %2, Color: %3")
        .arg(text, QString::fromStdString(VSISO8601FromDate(location, VSCalendar::current())),
             labelColor.name(QColor::HexArgb));
}
