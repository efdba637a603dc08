#include <fcntl.h>
#include <signal.h>
#include <unistd.h>

#include <clocale>
#include <cstdio>
#include <string>
#include <vector>

#include "Program/QVCommand.h"
#include "Program/QVProgram.h"

namespace {

/// Whoever starts the program without one of the three would have what is printed written into the first
/// file that is opened: a database, or an archive.
void occupyStandardDescriptors() {
    int descriptor = 0;
    while (descriptor >= 0 && descriptor <= STDERR_FILENO)
        descriptor = open("/dev/null", O_RDONLY | O_CLOEXEC);
    if (descriptor >= 0) close(descriptor);
}

/// A write beyond the limit of a file's size is an error to tell, not the end. A handler rather than to
/// ignore the signal, which the programs started from here would inherit.
void surviveSizeLimit() {
    struct sigaction action {};
    action.sa_handler = [](int) {};
    action.sa_flags = SA_RESTART;
    sigaction(SIGXFSZ, &action, nullptr);
}

}  // namespace

int main(int argc, char** argv) {
    occupyStandardDescriptors();
    surviveSizeLimit();
    std::setlocale(LC_CTYPE, "");  // names of files and of an archive's entries; numbers stay as they are
    const std::vector<std::string> arguments(argv + (argc > 0 ? 1 : 0), argv + argc);
    return static_cast<int>(QVRunProgram(argc, argv, arguments));
}
