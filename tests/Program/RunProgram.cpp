#include "RunProgram.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>

namespace test {

RunningProgram::RunningProgram(const std::vector<std::string>& arguments,
                               const std::map<std::string, std::string>& environment) {
    std::vector<char*> argv{const_cast<char*>(QELVAR_BINARY)};
    for (const auto& argument : arguments) argv.push_back(const_cast<char*>(argument.c_str()));
    argv.push_back(nullptr);
    std::vector<std::string> assignments;
    for (const auto& [name, value] : environment) assignments.push_back(name + "=" + value);
    std::vector<char*> envp;
    for (auto& assignment : assignments) envp.push_back(assignment.data());
    envp.push_back(nullptr);
    int output[2], error[2];
    if (pipe2(output, O_CLOEXEC) != 0 || pipe2(error, O_CLOEXEC) != 0) std::abort();
    pid_ = fork();
    if (pid_ == 0) {
        dup2(open("/dev/null", O_RDONLY), STDIN_FILENO);
        dup2(output[1], STDOUT_FILENO);
        dup2(error[1], STDERR_FILENO);
        execve(QELVAR_BINARY, argv.data(), envp.data());
        _exit(126);
    }
    close(output[1]);
    close(error[1]);
    output_ = output[0];
    error_ = error[0];
}

RunningProgram::~RunningProgram() {
    if (pid_ > 0) {
        kill(pid_, SIGKILL);
        wait();
    }
}

void RunningProgram::signal(int number) const {
    kill(pid_, number);
}

bool RunningProgram::readSome() {
    std::array<pollfd, 2> ends{{{output_, POLLIN, 0}, {error_, POLLIN, 0}}};
    if (output_ < 0 && error_ < 0) return false;
    if (poll(ends.data(), ends.size(), 120'000) <= 0) std::abort();
    for (auto& end : ends) {
        if (!end.revents) continue;
        std::array<char, 4096> buffer;
        const ssize_t count = read(end.fd, buffer.data(), buffer.size());
        int& descriptor = end.fd == output_ ? output_ : error_;
        std::string& text = end.fd == output_ ? outputText_ : errors_;
        if (count > 0) {
            text.append(buffer.data(), static_cast<size_t>(count));
        } else {
            close(descriptor);
            descriptor = -1;
        }
    }
    return true;
}

Outcome RunningProgram::wait() {
    while (readSome()) {
    }
    int status = 0;
    waitpid(pid_, &status, 0);
    pid_ = -1;
    Outcome outcome;
    outcome.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    outcome.signal = WIFSIGNALED(status) ? WTERMSIG(status) : 0;
    outcome.output = outputText_;
    outcome.errors = errors_;
    return outcome;
}

int Program::runInShell(const std::string& arguments) const {
    std::string line = "env -i";
    for (const auto& [name, value] : environment()) line += " '" + name + "=" + value + "'";
    const int status = std::system((line + " '" QELVAR_BINARY "' " + arguments).c_str());
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

std::map<std::string, std::string> Program::environment() const {
    std::map<std::string, std::string> result{{"TZ", "Europe/Copenhagen"},
                                              {"LC_ALL", "C.UTF-8"},
                                              {"HOME", folder_ / "home"},
                                              {"XDG_DATA_HOME", folder_ / "data"},
                                              {"QT_QPA_PLATFORM", "none-is-needed"}};
    for (const char* name : {"PATH", "ASAN_OPTIONS", "LSAN_OPTIONS", "UBSAN_OPTIONS", "TSAN_OPTIONS"}) {
        if (const char* value = std::getenv(name)) result[name] = value;
    }
    for (const auto& [name, value] : environment_) result[name] = value;
    return result;
}

std::vector<Row> rowsOf(const std::string& text) {
    const auto fieldsOf = [](const std::string& line) {
        std::vector<std::string> fields(1);
        for (const char c : line) {
            if (c == '\t')
                fields.emplace_back();
            else
                fields.back() += c;
        }
        return fields;
    };
    std::vector<Row> rows;
    std::vector<std::string> header;
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
        const auto fields = fieldsOf(line);
        if (header.empty()) {
            header = fields;
            continue;
        }
        Row row;
        for (size_t i = 0; i < header.size(); ++i) row[header[i]] = i < fields.size() ? fields[i] : "";
        rows.push_back(std::move(row));
    }
    return rows;
}

std::string contentOf(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

}  // namespace test
