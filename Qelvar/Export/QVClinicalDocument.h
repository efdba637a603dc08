#pragma once

#include <initializer_list>
#include <optional>
#include <string>
#include <utility>

#include "Qelvar/Export/QVExportText.h"
#include "Qelvar/Export/QVRecordsDocument.h"
#include "Qelvar/Export/QVXMLWriter.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSObject.h"

enum class QVClinicalSection { None, Results, Vitals };

/// The section of the clinical document in which the samples of a quantity type stand.
QVClinicalSection QVClinicalSectionForType(const VSObjectType* type);

/// The clinical document (HL7 CDA release 2): a header that names the patient and two sections, with an
/// observation for each sample of some quantity types. Used by one thread at a time; errors are the writer's.
class QVClinicalDocument {
 public:
    /// Writes into the file, which is empty.
    QVClinicalDocument(const QVExportFile& file, int secondsFromGMT);

    /// The declaration and the beginning of the root.
    void open();
    void writeCDAHeaderWithName(VSDate now, const std::string& name,
                                const std::optional<VSBirthDate>& birthDate, int biologicalSex);
    void writeCDAResultsHeader();
    void writeCDAVitalHeader();
    void writeCDASectionFooter();
    void writeCDAResultsOrganizerStart();
    void writeCDAVitalsOrganizerStartWithStartDate(VSDate startDate, VSDate endDate);
    void writeCDAOrganizerEnd();
    /// An observation. REQUIRES: a type of one of the sections.
    void writeCDAEntryWithValue(const VSQuantitySample& sample, const VSUnit& unit);
    /// Ends the document and closes its file.
    VSStatus close() { return writer_.finish(); }
    VSStatus status() const { return writer_.status(); }

 private:
    struct Attribute {
        const char* name;
        const char* value;
    };
    using Attributes = std::initializer_list<Attribute>;
    /// Starts an element; the caller ends it.
    void start(const char* name, Attributes attributes = {});
    /// An element without content.
    void leaf(const char* name, Attributes attributes);
    void end() { writer_.endElement(); }
    void writeSectionHeader(const char* templateRoot, const char* code, const char* displayName,
                            const char* title);
    void writeEffectiveTime(VSDate low, VSDate high);
    void writeObservationText(const VSQuantitySample& sample, const std::string& value,
                              const std::string& unit);

    QVXMLWriter writer_;
    QVExportDateFormatter dates_;
    QVDeviceTexts devices_;
};
