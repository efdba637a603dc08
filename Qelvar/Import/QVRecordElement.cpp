#include "Qelvar/Import/QVRecordElement.h"

#include "Qelvar/Import/QVExactInstructions.h"
#include "Qelvar/Import/QVImportText.h"

const VSValue* QVElement::exactValue(QVAttributeName attribute) const {
    if (!exact) return nullptr;
    const auto found = exact->attributes.find(attribute);
    return found == exact->attributes.end() ? nullptr : &found->second;
}

VSDuration QVElement::microsecondsOf(size_t date) const {
    return VSDuration(exact ? exact->microsecondsOf(date) : 0);
}

std::string QVElement::excerpt() const {
    constexpr size_t kLength = 240;
    std::string text = "<" + std::string(givenName);
    for (size_t i = 0; i < kQVAttributeCount && text.size() < kLength; ++i) {
        if (present >> i & 1U)
            text += std::string(" ") + kQVAttributeNames[i] + "=" + QVImportQuoted(values[i]);
    }
    return text + ">";
}
