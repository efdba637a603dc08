#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "Vessa/Base/VSDate.h"

/// What became of the records of one type, or of all.
struct QVImportCount {
    int64_t read = 0;
    int64_t added = 0;
    int64_t alreadyHad = 0;
    int64_t refused = 0;
    friend bool operator==(const QVImportCount&, const QVImportCount&) = default;
};

/// One element of a document that was not taken: a record, or a smaller part.
struct QVImportRefusal {
    std::string document;  // the file's name; for an entry of an archive "archive.zip:entry.xml"
    int64_t line = 0;      // where the element's start tag ends, from 1
    std::string element;   // "Record", "Correlation", "Workout" ...
    std::string type;      // the type as the document names it; empty when it names none
    std::string reason;    // one of few fixed texts, what refusals are counted by: "not a number"
    std::string detail;    // what exactly was found: "value \"7,5\""
    std::string excerpt;   // the beginning of the element

    /// "file.xml:12: Record VSQuantityTypeIdentifierHeartRate: not a number: value "7,5"".
    std::string description() const;
};

/// What an import did. Plain value. Members of correlations are not counted beside their correlation.
struct QVImportReport {
    std::vector<std::string> documents;  // the records documents read, named as in a refusal
    QVImportCount total;
    std::map<std::string, QVImportCount>
        byType;  // by type name ("HeartRate"); types unknown as the document names them
    std::vector<QVImportRefusal> refusals;            // the first ones in full, in the order of the documents
    std::map<std::string, int64_t> refusalsByReason;  // of records; they make total.refused
    std::map<std::string, int64_t> partRefusalsByReason;  // of smaller parts: a metadata entry, an event ...
    int characteristicsSet =
        0;  // characteristics of the person, and the Medical ID, that were not set before
    std::vector<std::string> notes;    // what was passed over, such as another document in an archive
    std::optional<VSDate> exportDate;  // the latest one that the documents give

    /// How many refusals, of records and of parts, are counted but not listed.
    int64_t refusalsNotListed() const;
};
