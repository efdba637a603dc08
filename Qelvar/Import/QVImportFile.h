#pragma once

#include <atomic>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "Qelvar/Import/QVFileKind.h"
#include "Vessa/Base/VSError.h"

/// A file to import as the documents in it: one of a plain file or a pipe, any number of an archive. Read
/// forwards only, by one thread. Nothing is written to disk and no entry's name is ever used as a path.
class QVImportFile {
 public:
    /// NotFound; Refused: not readable; Invalid: a folder, a file that by its first bytes is no document, an
    /// archive that cannot be read. `cancel` may be null and ends a wait for a pipe; `recognised`, which may
    /// be null, gets what the first bytes look like.
    static VSResult<std::unique_ptr<QVImportFile>> open(const std::filesystem::path& path,
                                                        const std::atomic<bool>* cancel,
                                                        QVRecognisedFile* recognised = nullptr);
    virtual ~QVImportFile() = default;

    /// Moves to the next document that may be XML; false: there is none. What is passed over leaves a note.
    virtual VSResult<bool> nextDocument() = 0;
    /// Up to `size` bytes of the document; 0 at its end. Invalid: damaged, encrypted, or out of all
    /// proportion.
    virtual VSResult<size_t> read(char* buffer, size_t size) = 0;

    /// "file.xml", or "archive.zip:entry.xml".
    virtual const std::string& documentName() const = 0;
    virtual bool isArchive() const = 0;
    /// Of the file as it lies on disk; the total is 0 for a pipe.
    virtual uint64_t bytesDone() const = 0;
    virtual uint64_t bytesTotal() const = 0;
    /// What was passed over so far.
    virtual const std::vector<std::string>& notes() const = 0;
};

/// The size of a regular file, else 0.
uint64_t QVImportFileSize(const std::filesystem::path& path);
