#pragma once

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>

#include "Vessa/Base/VSDate.h"

/// Who holds a store with a long piece of work, so that others need not wait for they know not whom. Plain
/// value.
struct VSStoreHolder {
    // In the notes of other programs: never change a number.
    enum class Work : int { Import = 1, Undo = 2, Deletion = 3 };
    enum class Program : int { Command = 1, Window = 2 };

    Work work = Work::Import;
    Program program = Program::Command;
    int64_t process = 0;
    VSDate since;
    std::string name;  // of an import its files, of an undo the number of its batch; may be empty

    friend bool operator==(const VSStoreHolder&, const VSStoreHolder&) = default;
    /// "an import of a.zip from the command line, process 4711".
    std::string description() const;
    /// What this process is to others: a command until it says otherwise. Before any other thread is started.
    static void setProgram(Program program);
};

/// A note beside the store that lasts as long as this does: a file under a lock of the system, which goes
/// with the process however that ends. It only informs, so where it cannot be left nothing happens. REQUIRES:
/// the store's writing transaction is this caller's, and outlasts the note, so that the next one finds its
/// place free.
class VSHolderNote {
 public:
    VSHolderNote(const std::filesystem::path& folder, VSStoreHolder::Work work, const std::string& name);
    ~VSHolderNote();
    VSHolderNote(const VSHolderNote&) = delete;
    VSHolderNote& operator=(const VSHolderNote&) = delete;

    static constexpr const char* fileName = "vessa.writer";

 private:
    int file_ = -1;
};

/// Who has left a note in the store's folder and still lives; none: nobody, or it is not known. Any thread.
std::optional<VSStoreHolder> VSReadStoreHolder(const std::filesystem::path& folder);
