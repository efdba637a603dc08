#include <fcntl.h>
#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>
#include <sched.h>
#include <sys/mount.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <map>

#include "ExportTestSupport.h"
#include "Qelvar/Export/QVExportTarget.h"

// Whatever a person, or chance, names as the place of an archive: no store changes by a single byte.

namespace {

namespace fs = std::filesystem;

using Content = std::map<std::string, std::string>;

/// Of a folder and all below it, links as links.
Content contentOf(const fs::path& folder) {
    Content content;
    for (const auto& entry : fs::recursive_directory_iterator(folder)) {
        const std::string name = entry.path().lexically_relative(folder).string();
        content[name] = entry.is_symlink()        ? "-> " + entry.path().string()
                        : entry.is_regular_file() ? test::contentOf(entry.path())
                                                  : "";
    }
    return content;
}

/// Two stores, a folder beside them, and how places in the stores can be named.
class Stores {
 public:
    Stores() {
        for (const char* name : {"ours", "other"}) {
            fs::copy(emptyStore(), path(name));
            fs::create_directory(path(name) / "documents");
            for (const char* file : {"user-defaults.json", "vessa.version-1.sqlite", "documents/export.zip"})
                std::ofstream(path(name) / file) << "something of a store";
        }
        fs::create_directory(path("outside"));
    }
    fs::path path(const std::string& name) const { return folder_.path() / name; }
    Content content() const {
        Content all;
        for (const char* name : {"ours", "other"})
            for (auto& [file, bytes] : contentOf(path(name))) all[name + ("/" + file)] = bytes;
        return all;
    }
    /// Opens the target as the person who insists would, and gives it something.
    VSStatus replace(const fs::path& target, const std::function<void()>& meanwhile = {}) const {
        auto opened = QVExportTarget::open(target, path("ours"));
        if (!opened) return opened.error();
        opened->allowReplacing();
        const auto work = opened->makeWorkFolder();
        if (!work) return work.error();
        std::ofstream((*work)->path() / "archive") << "an archive";
        if (meanwhile) meanwhile();
        return opened->take(**work, "archive");
    }
    /// The same place by another name; made with links outside, which may be used once more.
    fs::path byAnotherWay(const fs::path& place, int way) {
        const fs::path link = path("outside") / ("link" + std::to_string(++links_));
        const fs::path folder = place.parent_path();
        switch (way) {
            case 0:
                fs::create_symlink(place, link);
                return link;
            case 1:
                fs::create_directory_symlink(folder, link);
                return link / place.filename();
            case 2:
                return folder / "." / ".." / folder.filename() / place.filename();
            case 3:
                return fs::proximate(place);
            case 4:
                open_.emplace_back(open(folder.c_str(), O_PATH | O_CLOEXEC));
                return "/proc/self/fd/" + std::to_string(open_.back().get()) + "/" +
                       place.filename().string();
            default: {
                std::error_code error;  // not of what is not there
                fs::create_hard_link(place, link, error);
                return error ? place : link;
            }
        }
    }

 private:
    static fs::path emptyStore() {
        static const test::TemporaryFolder folder;
        static const bool isMade = VSHealthStore::open(folder.path()).ok();
        EXPECT_TRUE(isMade);
        return folder.path();
    }

    const test::TemporaryFolder folder_;
    std::vector<VSFileDescriptor> open_;
    int links_ = 0;
};

RC_GTEST_PROP(ExportTarget, NoWayLeadsIntoAStore, ()) {
    Stores stores;
    const auto store = *rc::gen::element<std::string>("ours", "other");
    const auto name = *rc::gen::element<std::string>(
        "vessa.sqlite", "vessa.sqlite-wal", "vessa.sqlite-shm", "VESSA.sqlite", "vessa.notice",
        "vessa.version-1.sqlite", "user-defaults.json", "documents", "documents/export.zip",
        "documents/new.zip", "new.zip", "no/folder.zip");
    fs::path place = stores.path(store) / name;
    for (const int way : *rc::gen::container<std::vector<int>>(rc::gen::inRange(0, 6)))
        place = stores.byAnotherWay(place, way);
    const Content before = stores.content();
    const VSStatus status = stores.replace(place);
    RC_LOG(place.string());
    RC_ASSERT(stores.content() == before);
    if (store == "ours") RC_ASSERT(!status.ok());
}

TEST(ExportTarget, WhatChangesAfterTheChoiceIsSeen) {
    Stores stores;
    const fs::path folder = stores.path("outside"), target = folder / "all.zip";
    const std::pair<const char*, std::function<void()>> changes[] = {
        {"a link to a database", [&] { fs::create_symlink(stores.path("other") / "vessa.sqlite", target); }},
        {"a database's other name",
         [&] { fs::create_hard_link(stores.path("other") / "vessa.sqlite", target); }},
        {"somebody's file", [&] { fs::create_directory(target); }},
        {"a store in the folder", [&] { std::ofstream(folder / "vessa.sqlite") << "new"; }},
        {"the folder in a store", [&] { fs::rename(folder, stores.path("ours") / "moved"); }},
    };
    for (const auto& [what, change] : changes) {
        EXPECT_FALSE(stores.replace(target, change).ok()) << what;
        EXPECT_EQ(test::contentOf(target).find("an archive"), std::string::npos) << what;
        EXPECT_FALSE(fs::exists(stores.path("ours") / "moved/all.zip"));
        fs::remove(target);
        fs::remove(folder / "vessa.sqlite");
    }
}

/// What the block answers in a process of its own that may do with itself what it likes.
int inAnotherProcess(const std::function<int()>& block) {
    const pid_t child = fork();
    if (child == 0) _exit(block());
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

constexpr int kImpossible = 99;
int codeOf(const VSStatus& status) {
    return status ? 98 : static_cast<int>(status.error().code);
}

TEST(ExportTarget, WhereNothingMayBeWrittenItSaysSo) {
    Stores stores;
    const fs::path folder = stores.path("outside");
    fs::permissions(stores.path(""), fs::perms::owner_all | fs::perms::others_all);
    fs::permissions(folder, fs::perms::owner_read | fs::perms::owner_exec | fs::perms::others_read |
                                fs::perms::others_exec);
    EXPECT_EQ(inAnotherProcess([&] {
                  constexpr uid_t nobody = 65534;
                  if (geteuid() == 0 && setresuid(nobody, nobody, nobody) != 0) return kImpossible;
                  return codeOf(stores.replace(folder / "all.zip"));
              }),
              static_cast<int>(VSErrorCode::Refused));
    fs::permissions(folder, fs::perms::owner_all);
    const auto withMounts = [&](const std::function<int()>& block) {
        return inAnotherProcess([&] {
            if (unshare(CLONE_NEWNS) != 0 && unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) return kImpossible;
            mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr);
            return block();
        });
    };
    const int readOnly = withMounts([&] {
        if (mount("tmpfs", folder.c_str(), "tmpfs", MS_RDONLY, nullptr) != 0) return kImpossible;
        return codeOf(stores.replace(folder / "all.zip"));
    });
    if (readOnly == kImpossible) GTEST_SKIP() << "mounts are not permitted here";
    EXPECT_EQ(readOnly, static_cast<int>(VSErrorCode::Failed));
    for (const char* part : {"", "documents"}) {
        const Content before = stores.content();
        EXPECT_EQ(withMounts([&] {
                      const fs::path from = stores.path("ours") / part;
                      if (mount(from.c_str(), folder.c_str(), nullptr, MS_BIND, nullptr) != 0)
                          return kImpossible;
                      return codeOf(stores.replace(folder / "all.zip"));
                  }),
                  static_cast<int>(VSErrorCode::Refused));
        EXPECT_EQ(stores.content(), before) << part;
    }
}

TEST(WorkFolder, PlantedOnesAreNeitherEmptiedNorFollowed) {
    Stores stores;
    const fs::path folder = stores.path("outside"), target = folder / "all.zip";
    auto opened = QVExportTarget::open(target, stores.path("ours"));
    const auto nameNow = [&] { return (*opened->makeWorkFolder())->path().filename().string(); };
    const std::string expected = nameNow();
    EXPECT_EQ(nameNow(), expected) << "else nothing can be planted there";
    EXPECT_TRUE(fs::is_empty(folder));
    const fs::path victim = stores.path("victim");
    fs::create_directories(victim / "export");
    std::ofstream(victim / "export" / "export.xml") << "precious";
    const auto expectUnharmed = [&](const fs::path& planted) {
        const Content before = contentOf(planted);
        EXPECT_NE(nameNow(), expected);
        EXPECT_EQ(contentOf(planted), before);
        EXPECT_TRUE(fs::exists(fs::symlink_status(folder / expected)));
    };
    fs::create_directory_symlink(victim, folder / expected);
    expectUnharmed(victim);
    fs::remove(folder / expected);
    fs::rename(victim, folder / expected);
    fs::permissions(folder / expected, fs::perms::all);
    expectUnharmed(folder / expected);
    fs::permissions(folder / expected, fs::perms::owner_all);
    if (chown((folder / expected).c_str(), 65534, 65534) == 0) expectUnharmed(folder / expected);
    // Of a private folder of such a name of one's own, which nobody holds, it is known who left it.
    ASSERT_EQ(chown((folder / expected).c_str(), geteuid(), getegid()), 0);
    EXPECT_EQ(nameNow(), expected);
    EXPECT_TRUE(fs::is_empty(folder));
}

/// As it is in the window: the folder has a name of its own, and what is linked there is not ours to empty.
TEST(WorkFolder, ALinkInThePlaceOfTheDocumentsIsRefused) {
    const test::FixedEnvironment environment;
    Stores stores;
    fs::remove_all(stores.path("ours") / "documents");
    fs::create_directory(stores.path("outside") / "export");
    std::ofstream(stores.path("outside") / "export" / "thesis.tex") << "precious";
    fs::create_directory_symlink(stores.path("outside"), stores.path("ours") / "documents");
    const auto store = VSHealthStore::open(stores.path("ours"));
    QVExportManager manager(test::exportSetting(*store, stores.path("ours") / "documents"));
    QVExportFiles::removeLeftovers(manager.paths());
    const auto archive = test::exportAll(manager);
    ASSERT_FALSE(archive.ok());
    EXPECT_EQ(archive.error().code, VSErrorCode::Refused);
    EXPECT_EQ(test::contentOf(stores.path("outside") / "export" / "thesis.tex"), "precious");
}

}  // namespace
