#pragma once

#include <sys/types.h>

#include <filesystem>
#include <string>
#include <string_view>

#include "Vessa/Base/VSError.h"
#include "Vessa/Base/VSFileDescriptor.h"

/// A folder in which private files are while they are made: for its owner only, held open, and locked as long
/// as it is used, so that others tell it from one that a killed process has left. All that is made and
/// removed in it goes through its descriptor, never through a link. Used by one thread at a time.
class VSWorkFolder {
 public:
    /// A new one in the open folder `parent` for work on the file `target` there; goes with this object.
    /// First removes what killed processes have left there of such folders. NotAccessible with
    /// isHeldByOthers: the same target is being worked on; else as the system says, about `place`.
    static VSResult<VSWorkFolder> makeFor(const std::string& target, int parent,
                                          const std::filesystem::path& place);
    /// One with a name of its own in the open folder `parent`, which stays when this object goes. Refused:
    /// what has the name is a link, no folder or somebody else's; NotAccessible with isHeldByOthers: in use.
    static VSResult<VSWorkFolder> open(const std::string& name, int parent,
                                       const std::filesystem::path& place);

    VSWorkFolder(VSWorkFolder&& other) noexcept = default;
    VSWorkFolder& operator=(VSWorkFolder&&) = delete;
    ~VSWorkFolder();

    int descriptor() const { return folder_.get(); }
    /// Where it was when it was made, for messages.
    const std::filesystem::path& path() const { return path_; }

    /// A folder that was not there before; 0700.
    VSResult<VSFileDescriptor> makeFolder(const std::string& name) const;
    /// A file or a folder with all that is in it, as far as it is the same owner's and on the same disk.
    /// Nothing where there is none.
    void remove(const std::string& name) const;
    void removeAll() const;

 private:
    VSWorkFolder(VSFileDescriptor folder, VSFileDescriptor parent, std::string name,
                 std::filesystem::path path)
        : folder_(std::move(folder)),
          parent_(std::move(parent)),
          name_(std::move(name)),
          path_(std::move(path)) {}

    VSFileDescriptor folder_;
    VSFileDescriptor parent_;  // none: this folder stays
    std::string name_;
    std::filesystem::path path_;
};
