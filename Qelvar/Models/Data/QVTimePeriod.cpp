#include "Qelvar/Models/Data/QVTimePeriod.h"

#include "Vessa/Base/VSCalendar.h"
#include "Vessa/VSObject.h"

QVTimePeriod::QVTimePeriod(const VSSample& sample) : QVTimePeriod(sample.startDate(), sample.endDate()) {}

std::string QVTimePeriod::description() const {
    const VSCalendar calendar = VSCalendar::current();
    return VSISO8601FromDate(startDate_, calendar) + " - " + VSISO8601FromDate(endDate_, calendar);
}
