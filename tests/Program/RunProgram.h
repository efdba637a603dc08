#pragma once

#include <filesystem>
#include <map>
#include <string>
#include <vector>

namespace test {

/// How a run of the program ended.
struct Outcome {
    int status = 0;  // the exit status; -1 when a signal ended it
    int signal = 0;  // that signal
    std::string output, errors;
};

/// A run of the real binary, without any display.
class RunningProgram {
 public:
    RunningProgram(const std::vector<std::string>& arguments,
                   const std::map<std::string, std::string>& environment);
    ~RunningProgram();  // kills what still runs
    RunningProgram(const RunningProgram&) = delete;
    RunningProgram& operator=(const RunningProgram&) = delete;

    /// Waits until a complete line of standard error meets the condition; false when the program ended
    /// before.
    template <typename Condition>
    bool waitForErrorLine(Condition condition) {
        for (size_t begin = 0;;) {
            const size_t end = errors_.find('\n', begin);
            if (end == std::string::npos) {
                if (!readSome()) return false;
            } else if (condition(errors_.substr(begin, end - begin))) {
                return true;
            } else {
                begin = end + 1;
            }
        }
    }
    void signal(int number) const;
    Outcome wait();

 private:
    bool readSome();  // false: both ends are closed

    int pid_ = -1;
    int output_ = -1, error_ = -1;
    std::string outputText_, errors_;
};

/// A store in a temporary folder and the program run on it.
class Program {
 public:
    explicit Program(std::filesystem::path folder) : folder_(std::move(folder)) {}
    void set(const std::string& name, const std::string& value) { environment_[name] = value; }
    std::filesystem::path folder() const { return folder_; }

    Outcome run(const std::vector<std::string>& arguments) const {
        return RunningProgram(arguments, environment()).wait();
    }
    /// The exit status with a command line that a shell reads.
    int runInShell(const std::string& arguments) const;
    std::map<std::string, std::string> environment() const;

 private:
    const std::filesystem::path folder_;
    std::map<std::string, std::string> environment_;
};

/// Tab-separated rows with a header, by column.
using Row = std::map<std::string, std::string>;
std::vector<Row> rowsOf(const std::string& text);

/// All bytes of a file; none when it cannot be read.
std::string contentOf(const std::filesystem::path& path);

}  // namespace test
