#pragma once

#include <filesystem>
#include <optional>
#include <string>

#include "Qelvar/Import/QVImportFileDescriptor.h"
#include "Vessa/Base/VSError.h"

/// The base names of the documents and of the archive, in the person's language.
struct QVExportNames {
    std::string records = "export";
    std::string clinical = "export_cda";
    std::string archive = "export";
};

/// Where an export puts its files.
struct QVExportPaths {
    QVExportPaths(const std::filesystem::path& documents, const QVExportNames& names)
        : documentsPath(documents),
          exportPath(documents / "export"),
          filePath(exportPath / (names.records + ".xml")),
          CDAFilePath(exportPath / (names.clinical + ".xml")),
          archivePath(documents / (names.archive + ".zip")) {}
    std::filesystem::path documentsPath;
    std::filesystem::path exportPath;   // holds the two documents, and nothing else
    std::filesystem::path filePath;     // the records document
    std::filesystem::path CDAFilePath;  // the clinical document
    std::filesystem::path archivePath;  // beside exportPath, so that packing that never packs the archive
};

/// The files of an export while they exist. They are for their owner's eyes only (0700, 0600) and go with
/// this object; a lock on the folder, which ends with the process however it ends, keeps a second export out,
/// and what a killed one has left is removed by the next. Used by one thread at a time.
class QVExportFiles {
 public:
    /// Makes the folders and the three files, empty. NotAccessible with isHeldByOthers: another export has
    /// the folder; else as the system says.
    static VSResult<QVExportFiles> create(const QVExportPaths& paths);
    /// Removes what a killed export has left; nothing where there is none, or one is under way.
    static void removeLeftovers(const QVExportPaths& paths);

    QVExportFiles(QVExportFiles&& other) noexcept;
    QVExportFiles& operator=(QVExportFiles&&) = delete;
    ~QVExportFiles() { remove(); }

    /// Removes the documents and the archive; errors are ignored.
    void remove();
    /// The same without the archive.
    void removeDocuments();

 private:
    QVExportFiles(QVExportPaths paths, QVImportFileDescriptor lock)
        : paths_(std::move(paths)), lock_(std::move(lock)) {}
    static VSResult<QVImportFileDescriptor> lock(const std::filesystem::path& folder);
    VSStatus make();

    std::optional<QVExportPaths> paths_;  // none: they are another object's
    QVImportFileDescriptor lock_;
};
