#include "Qelvar/Import/QVRecordElement.h"

#include "Qelvar/Import/QVImportText.h"

std::string QVElement::excerpt() const {
    constexpr size_t kLength = 240;
    std::string text = "<" + std::string(givenName);
    for (size_t i = 0; i < kQVAttributeCount && text.size() < kLength; ++i) {
        if (present >> i & 1U)
            text += std::string(" ") + kQVAttributeNames[i] + "=" + QVImportQuoted(values[i]);
    }
    return text + ">";
}
