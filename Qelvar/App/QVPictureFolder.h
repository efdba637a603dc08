#pragma once

#include <QByteArray>
#include <QImage>
#include <filesystem>
#include <string>

#include "Vessa/VSStoreGuard.h"

/// A folder of pictures, none of them in a store or written through a link. Main thread only.
class QVPictureFolder {
 public:
    /// Makes it where it is missing. `store`: the folder of the store at work.
    static VSResult<QVPictureFolder> open(const std::filesystem::path& folder,
                                          const std::filesystem::path& store);
    /// In the place of an older one, as a whole.
    VSStatus save(const QImage& picture, const std::string& name) const;

 private:
    QVPictureFolder(VSStoreGuard guard, std::filesystem::path path, VSFileDescriptor folder)
        : guard_(std::move(guard)), path_(std::move(path)), folder_(std::move(folder)) {}
    VSStatus write(const std::string& name, const QByteArray& content, const std::string& part) const;

    VSStoreGuard guard_;
    std::filesystem::path path_;
    VSFileDescriptor folder_;
};
