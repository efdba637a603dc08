#include "Vessa/VSStoreHolder.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <sstream>

#include "Vessa/Base/VSEnvironment.h"

namespace {

constexpr int kFormat = 1;
constexpr const char* kEnd = "end";
constexpr size_t kLongestName = 2048;
constexpr size_t kLongestNote = 4096;

std::atomic<VSStoreHolder::Program> thisProgram = VSStoreHolder::Program::Command;

struct flock wholeFile() {
    struct flock lock {};
    lock.l_type = F_WRLCK;
    lock.l_whence = SEEK_SET;
    return lock;
}

int openNote(const std::filesystem::path& folder, int flags) {
    const auto file = folder / VSHolderNote::fileName;
    return open(file.c_str(), flags | O_CLOEXEC | O_NOFOLLOW | O_NONBLOCK, 0600);
}

bool isLocked(int file) {
    auto lock = wholeFile();
    return fcntl(file, F_OFD_GETLK, &lock) == 0 && lock.l_type != F_UNLCK;
}

/// One line for each field, and a last one, without which a note is not written to its end.
std::string textOf(const VSStoreHolder& holder) {
    std::ostringstream text;
    text << kFormat << '\n'
         << static_cast<int>(holder.work) << '\n'
         << static_cast<int>(holder.program) << '\n'
         << holder.process << '\n'
         << holder.since.microseconds() << '\n'
         << holder.name << '\n'
         << kEnd << '\n';
    return text.str();
}

std::optional<VSStoreHolder> holderFromText(const std::string& note) {
    std::istringstream text(note);
    int format = 0, work = 0, program = 0;
    int64_t since = 0;
    VSStoreHolder holder;
    std::string end;
    text >> format >> work >> program >> holder.process >> since;
    text.ignore();
    std::getline(text, holder.name);
    std::getline(text, end);
    if (!text || end != kEnd || format != kFormat || holder.process <= 0) return std::nullopt;
    holder.work = static_cast<VSStoreHolder::Work>(work);
    holder.program = static_cast<VSStoreHolder::Program>(program);
    holder.since = VSDate::fromMicroseconds(since);
    return holder;
}

bool lives(int64_t process) {
    return kill(static_cast<pid_t>(process), 0) == 0 || errno == EPERM;
}

}  // namespace

void VSStoreHolder::setProgram(Program program) {
    thisProgram = program;
}

std::string VSStoreHolder::description() const {
    const std::string of = name.empty() ? "" : " of " + name;
    const std::string what = work == Work::Import ? "an import" + of
                             : work == Work::Undo ? "the undoing of import " + name
                                                  : "a deletion" + of;
    const char* where = program == Program::Window ? " in a window" : " from the command line";
    return what + where + ", process " + std::to_string(process);
}

VSHolderNote::VSHolderNote(const std::filesystem::path& folder, VSStoreHolder::Work work,
                           const std::string& name)
    : file_(openNote(folder, O_RDWR | O_CREAT)) {
    auto lock = wholeFile();
    if (file_ < 0 || fcntl(file_, F_OFD_SETLK, &lock) != 0) {
        if (file_ >= 0) close(file_);
        file_ = -1;
        return;
    }
    VSStoreHolder holder{work, thisProgram, getpid(), VSEnvironment::current()->now(),
                         name.substr(0, kLongestName)};
    std::replace_if(
        holder.name.begin(), holder.name.end(), [](char c) { return static_cast<unsigned char>(c) < 0x20; },
        ' ');
    const std::string text = textOf(holder);
    if (ftruncate(file_, 0) != 0 ||
        pwrite(file_, text.data(), text.size(), 0) != static_cast<ssize_t>(text.size()))
        return;  // without its end nobody takes it for a note
}

VSHolderNote::~VSHolderNote() {
    if (file_ < 0) return;
    // The names of a person's files are nobody's business afterwards.
    [[maybe_unused]] const int ignored = ftruncate(file_, 0);
    close(file_);
}

std::optional<VSStoreHolder> VSReadStoreHolder(const std::filesystem::path& folder) {
    const int file = openNote(folder, O_RDONLY);
    if (file < 0) return std::nullopt;
    std::optional<VSStoreHolder> holder;
    if (isLocked(file)) {
        std::string text(kLongestNote, '\0');
        const ssize_t length = pread(file, text.data(), text.size(), 0);
        text.resize(static_cast<size_t>(std::max<ssize_t>(length, 0)));
        holder = holderFromText(text);
    }
    close(file);
    // Of one who was killed the note may be there for a moment after the next one got the lock.
    return holder && lives(holder->process) ? holder : std::nullopt;
}
