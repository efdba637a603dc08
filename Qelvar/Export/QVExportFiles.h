#pragma once

#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "Qelvar/Export/QVXMLWriter.h"
#include "Vessa/Base/VSError.h"
#include "Vessa/VSWorkFolder.h"

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
/// this object; the work folder's lock, which ends with the process however it ends, keeps a second export
/// out, and what a killed one has left is removed by the next. They are written through descriptors, whatever
/// happens to their names meanwhile. Used by one thread at a time.
class QVExportFiles {
 public:
    /// Makes the three files, empty, in the folder that was made for them or (null) in documentsPath, which
    /// is made too. NotAccessible with isHeldByOthers: another export has the folder; else as the system
    /// says.
    static VSResult<QVExportFiles> create(const QVExportPaths& paths,
                                          std::shared_ptr<const VSWorkFolder> folder = nullptr);
    /// Removes what a killed export has left in documentsPath; nothing where there is none, or one is under
    /// way.
    static void removeLeftovers(const QVExportPaths& paths);

    QVExportFiles(QVExportFiles&& other) noexcept = default;
    QVExportFiles& operator=(QVExportFiles&&) = delete;
    ~QVExportFiles() { remove(); }

    QVExportFile recordsDocument() const { return {paths_.filePath, records_.get()}; }
    QVExportFile clinicalDocument() const { return {paths_.CDAFilePath, clinical_.get()}; }
    QVExportFile exportFolder() const { return {paths_.exportPath, export_.get()}; }
    QVExportFile archive() const { return {paths_.archivePath, archive_.get()}; }

 private:
    QVExportFiles(QVExportPaths paths, std::shared_ptr<const VSWorkFolder> folder)
        : paths_(std::move(paths)), folder_(std::move(folder)) {}
    VSStatus make();
    void remove() const;

    QVExportPaths paths_;
    std::shared_ptr<const VSWorkFolder> folder_;  // null: they are another object's
    VSFileDescriptor export_, records_, clinical_, archive_;
};
