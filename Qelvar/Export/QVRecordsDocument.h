#pragma once

#include <memory>
#include <optional>
#include <string>

#include "Qelvar/Export/QVExactWriter.h"
#include "Qelvar/Export/QVExportText.h"
#include "Qelvar/Export/QVExportUnits.h"
#include "Qelvar/Export/QVXMLWriter.h"
#include "Vessa/VSHealthStore.h"
#include "Vessa/VSObject.h"

/// What a sample says of its origin, as an export writes it. Samples share their devices, so a device's text
/// is made once. Used by one thread.
class QVDeviceTexts {
 public:
    /// Empty: no device. Valid until the next call.
    const std::string& textOf(const VSSample& sample);

 private:
    std::shared_ptr<const VSDevice> device_;
    std::string text_;
};

/// The records document: every record of the store, in the elements that the import reads. Used by one thread
/// at a time; errors are the writer's.
class QVRecordsDocument {
 public:
    /// Writes into the file, which is empty.
    QVRecordsDocument(const QVExportFile& file, int secondsFromGMT, const QVExportUnits& units);

    /// The declaration and the beginning of the root.
    void open(const std::string& locale);
    /// REQUIRES: called before the first record, where samples belong together.
    void setRelations(VSStoreSnapshot::Relations relations) { exact_.setRelations(std::move(relations)); }
    void writeXMLPersonWithDateOfBirth(VSDate now, const std::optional<VSBirthDate>& dateOfBirth,
                                       int biologicalSex, int bloodType, int skinType,
                                       const std::optional<VSMedicalIDData>& medicalID);
    // One record of each kind.
    void writeRecord(const VSSample& sample);
    void writeCorrelation(const VSCorrelation& correlation);
    void writeWorkout(const VSWorkout& workout);
    /// Ends the document and closes its file.
    VSStatus close() { return writer_.finish(); }
    VSStatus status() const { return writer_.status(); }

 private:
    /// A value that is absent or empty gives no attribute.
    struct Value {
        std::string unit, text;
        bool present = false;
        std::optional<double> exact;  // in the canonical unit, where the text does not give it back
    };
    Value valueOf(const VSSample& sample) const;
    void writeXMLRecordWithType(const VSSample& sample, const Value& value);
    void writeXMLCorrelationStartWithType(const VSCorrelation& correlation);
    void writeXMLCorrelationEnd() { writer_.endElement(); }
    void writeXMLWorkoutStartWithActivityType(const VSWorkout& workout);
    void writeXMLWorkoutEventWithEventType(const VSWorkoutEvent& event);
    void writeXMLWorkoutEnd() { writer_.endElement(); }

    void startElement(const char* name, const VSSample& sample);
    void writeOrigin(const VSSample& sample);
    void writeDates(const VSSample& sample);
    void writeAmount(const char* name, const char* unitName, double amount, const std::string& unit);
    void writeMetadata(const VSMetadata& metadata);
    void writeExactTotal(const char* name, const std::optional<VSQuantity>& total, const VSUnit& unit,
                         VSTypeCode type);
    void writeExactDuration(VSDuration duration);

    QVXMLWriter writer_;
    QVExactWriter exact_;
    QVExportDateFormatter dates_;
    const QVExportUnits& units_;
    QVDeviceTexts devices_;
};
