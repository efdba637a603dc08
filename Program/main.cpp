#include <clocale>
#include <cstdio>
#include <string>
#include <vector>

#include "Program/QVCommand.h"
#include "Program/QVProgram.h"

int main(int argc, char** argv) {
    std::setlocale(LC_CTYPE, "");  // names of files and of an archive's entries; numbers stay as they are
    const std::vector<std::string> arguments(argv + (argc > 0 ? 1 : 0), argv + argc);
    return static_cast<int>(QVRunProgram(argc, argv, arguments));
}
