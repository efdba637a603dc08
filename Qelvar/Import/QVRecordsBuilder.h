#pragma once

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "Qelvar/Import/QVExactInstructions.h"
#include "Qelvar/Import/QVImportBatch.h"
#include "Qelvar/Import/QVImportReport.h"
#include "Qelvar/Import/QVImportText.h"
#include "Qelvar/Import/QVRecordCaches.h"
#include "Qelvar/Import/QVRecordElement.h"

/// Turns the elements of records documents into samples, in batches, and refuses what makes no sense. It
/// lives through all documents of an import. Used by one thread.
class QVRecordsBuilder {
 public:
    /// REQUIRES: the queue outlives the builder.
    QVRecordsBuilder(size_t listedRefusals, QVImportQueue& queue);

    void beginDocument(const std::string& name);
    /// Hands over what is left of the document.
    void endDocument();
    /// Forgets a document of which nothing was read. REQUIRES: no element was started since beginDocument.
    void abandonDocument() { report_.documents.pop_back(); }

    /// The elements as they open and close; `parent` is a place where the document may have it.
    void start(const QVElement& element, QVElementName parent);
    void end(QVElementName name, QVElementName parent);
    /// An element that has no place where it stands. It is passed over with all that it holds.
    void unexpectedElement(const QVElement& element);

    /// Of the document; what they say of an element is with the element.
    QVExactInstructions& instructions() { return instructions_; }

    /// Nobody takes the records any more.
    bool isStopped() const { return stopped_; }

    /// Read, refused, documents, export date. Added and already had are the store's to say.
    QVImportReport takeReport();

 private:
    struct Problem {
        const char* reason;
        std::string detail;
    };
    using Check = std::optional<Problem>;  // none: all is well
    /// A record between its start and its end.
    struct Draft {
        const VSObjectType* type = nullptr;
        VSDate start, end;
        VSProvenance provenance;
        int64_t line = 0;
        std::optional<VSQuantity> quantity;
        int value = 0;  // of a category, or a workout's activity
        VSMetadata metadata;
        size_t metadataBytes = 0;
        VSImportRelations relations;
        std::optional<QVImportRefusal> refusal;
        void reset();
    };
    struct WorkoutDraft {
        VSDuration duration{};
        std::optional<VSQuantity> distance, energy;
        std::vector<VSWorkoutEvent> events;
    };

    void startRecord(const QVElement& element, Draft& draft);
    void startCorrelation(const QVElement& element);
    void startWorkout(const QVElement& element);
    void addMetadata(const QVElement& element, Draft& draft);
    void addWorkoutEvent(const QVElement& element);
    void readPerson(const QVElement& element);
    void readMedicalID(const QVElement& element, QVImportPerson& person);
    void readExportDate(const QVElement& element);
    void endRecord();
    void endMember();
    void endCorrelation();
    void endWorkout();

    static Check checkLengths(const QVElement& element);
    Check readCommon(const QVElement& element, Draft& draft);
    Check readDates(const QVElement& element, Draft& draft);
    static Check readDate(std::string_view text, QVAttributeName attribute, QVImportDate& date);
    Check readOrigin(const QVElement& element, Draft& draft);
    Check readValue(const QVElement& element, Draft& draft);
    Check readQuantity(const QVElement& element, Draft& draft);
    Check readAmount(const QVElement& element, QVAttributeName amount, QVAttributeName unit, VSTypeCode type,
                     std::optional<VSQuantity>& result);
    Check readDuration(const QVElement& element, VSDuration& duration);

    /// Of a part: its record goes on without it.
    void refuse(const QVElement& element, Problem problem);
    QVImportRefusal refusal(const QVElement& element, Problem problem) const;
    void count(const Draft& draft, std::string_view typeAsGiven);
    void list(QVImportRefusal refusal);
    QVImportCount& countOf(const VSObjectType* type, std::string_view typeAsGiven);
    void finishMetadata(Draft& draft);
    template <typename Sample, typename... Arguments>
    void emit(Arguments&&... arguments);
    void flush();

    const size_t listedRefusals_;
    QVImportQueue& queue_;
    const QVTypeIndex types_;
    QVUnitIndex units_;
    QVInterned<VSSourceRevision> revisions_;
    QVInterned<VSDevice> devices_;
    std::shared_ptr<const VSMetadata> lastMetadata_;
    std::string revisionKey_;
    QVExactInstructions instructions_;

    QVImportBatch batch_;
    size_t batchBytes_ = 0;  // of its texts, about
    Draft record_;           // the Record, Correlation or Workout that is open
    Draft member_;           // the Record in it
    std::vector<VSSamplePtr> members_;
    WorkoutDraft workout_;
    std::string givenType_;              // of record_, as the document writes it, when it was refused
    std::vector<QVImportCount> counts_;  // by type code
    QVImportReport report_;
    bool stopped_ = false;
};
