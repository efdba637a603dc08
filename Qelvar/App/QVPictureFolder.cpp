#include "Qelvar/App/QVPictureFolder.h"

#include <fcntl.h>
#include <unistd.h>

#include <QBuffer>
#include <QFile>
#include <cerrno>

#include "Vessa/VSDatabase.h"

VSResult<QVPictureFolder> QVPictureFolder::open(const std::filesystem::path& folder,
                                                const std::filesystem::path& store) {
    VSStoreGuard guard(store);
    auto opened = guard.makeFolder(folder, 0777);
    if (!opened) return opened.error();
    return QVPictureFolder(std::move(guard), folder, std::move(*opened));
}

VSStatus QVPictureFolder::write(const std::string& name, const QByteArray& content,
                                const std::string& part) const {
    const std::string place = (path_ / name).string();
    QFile file;
    const int descriptor =
        openat(folder_.get(), part.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0666);
    if (descriptor < 0) return VSErrorFromSystem(errno, place);
    if (!file.open(descriptor, QIODevice::WriteOnly | QIODevice::Unbuffered, QFileDevice::AutoCloseHandle)) {
        close(descriptor);
        return VSError{VSErrorCode::Failed, place + " could not be written"};
    }
    if (file.write(content) != content.size()) return VSErrorFromSystem(errno, place);
    // Once more now: what may be replaced, and where, is decided at this moment.
    if (VSStatus status = guard_.checkFolder(folder_.get(), place); !status) return status;
    if (VSStatus status = guard_.checkFile(folder_.get(), name, place); !status) return status;
    const bool isNamed = renameat(folder_.get(), part.c_str(), folder_.get(), name.c_str()) == 0;
    return isNamed ? VSStatus() : VSErrorFromSystem(errno, place);
}

VSStatus QVPictureFolder::save(const QImage& picture, const std::string& name) const {
    QByteArray content;
    QBuffer buffer(&content);
    if (picture.isNull() || !buffer.open(QIODevice::WriteOnly) || !picture.save(&buffer, "PNG"))
        return VSError{VSErrorCode::Failed, (path_ / name).string() + " could not be drawn"};
    const std::string part = "." + name + ".part-" + std::to_string(getpid());
    unlinkat(folder_.get(), part.c_str(), 0);  // what a killed process of the same number had
    VSStatus status = write(name, content, part);
    if (!status) unlinkat(folder_.get(), part.c_str(), 0);
    return status;
}
