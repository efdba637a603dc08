#pragma once

#include <filesystem>
#include <string>
#include <string_view>

#include "Vessa/Base/VSError.h"

// What a file is that somebody wants to import, so that one that cannot be is told by what it looks like.

enum class QVFileKind {
    MayHoldRecords,  // only reading the whole will tell more
    Missing,
    NotReadable,  // not permitted
    Folder,
    Empty,
    PDF,
    Picture,
    Media,    // sound or video
    Program,  // to be run by the machine
    Script,
    Table,  // lines of fields: CSV
    JSON,
    WebPage,
    ClinicalDocument,
    OtherXML,               // `detail` is its root element
    ArchiveWithoutRecords,  // a .zip
    UnreadableArchive,      // a .zip; `detail` says why
    OfficeDocument,
    OtherArchive,  // `detail` is its kind: "7z"
    Database,
    Activity,  // the binary record of a sports watch
    Text,
    Binary,
};

struct QVRecognisedFile {
    QVFileKind kind = QVFileKind::MayHoldRecords;
    std::string detail;
    bool mayHoldRecords() const { return kind == QVFileKind::MayHoldRecords; }
};

/// By the first bytes of a document, a kilobyte or so; a .zip may hold records. Pure.
QVRecognisedFile QVRecogniseBytes(std::string_view beginning);

/// Looks into the file, of an archive into the beginning of each document. Waits for the disk, never for a
/// pipe: one may hold records. Any thread.
QVRecognisedFile QVRecogniseFile(const std::filesystem::path& path);

/// What is wrong with it and what was expected: NotFound, Refused or Invalid, "NAME: looks like a PDF; ...".
/// REQUIRES: it cannot hold records.
VSError QVUnfitFileError(const std::string& name, const QVRecognisedFile& file);
