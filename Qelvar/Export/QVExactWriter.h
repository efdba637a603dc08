#pragma once

#include <optional>
#include <string>
#include <unordered_map>
#include <vector>

#include "Qelvar/Export/QVXMLWriter.h"
#include "Qelvar/Import/QVExactInstructions.h"
#include "Vessa/VSObject.h"
#include "Vessa/VSStoreSnapshot.h"

/// Writes the instructions of a records document: before an element what its attributes cannot say, and what
/// holds for many elements where it changes. Others pass over them; the import reads them
/// (docs/exact-instructions.md). Used by one thread.
class QVExactWriter {
 public:
    /// REQUIRES: the writer outlives this.
    QVExactWriter(QVXMLWriter& writer, int secondsFromGMT) : writer_(writer), timeZone_(secondsFromGMT) {}

    void setRelations(VSStoreSnapshot::Relations relations);
    void writeVersion();
    void writeMedicalID(const VSMedicalIDData& data);
    /// What the attributes that all records have cannot say: origin and dates.
    void writeProvenance(const VSSample& sample, const std::string& deviceText);
    /// What a top-level record has to do with others, and what a correlation's member is.
    void writeRelations(const VSSample& record);
    void writeMember(const VSSample& member);
    void writeEventDate(VSDate date);

    void writeValue(std::string_view name, const VSValue& value);
    /// Unless XML can hold the text.
    void writeText(std::string_view name, const std::string& text);

 private:
    void writeSource(const VSSource& source);
    void writeMicroseconds(std::vector<int> dates);
    const std::vector<int64_t>& workoutsOf(VSObjectID sample);

    QVXMLWriter& writer_;
    VSStoreSnapshot::Relations relations_;
    int64_t lastNumber_ = 0;
    std::unordered_map<VSObjectID, int64_t> numbers_;  // of named members

    // What was said last:
    std::optional<int> timeZone_;
    QVExactSources sources_;
    std::vector<int64_t> workouts_, found_;
};
