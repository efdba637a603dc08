#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <functional>

namespace test {

/// Another process that runs the block and ends; it shares nothing with this one but the pipes. No other
/// thread runs in a test that makes one.
class Child {
 public:
    /// The block gets a function that says a line to the parent and one that waits for the parent's word.
    using Block =
        std::function<void(const std::function<void(char)>& say, const std::function<bool()>& listen)>;
    explicit Child(const Block& block) {
        int up[2], down[2];
        if (pipe2(up, O_CLOEXEC) || pipe2(down, O_CLOEXEC)) std::abort();
        process_ = fork();
        if (process_ == 0) {
            close(up[0]);
            close(down[1]);
            block(
                [&](char word) {
                    if (write(up[1], &word, 1) != 1) _exit(2);
                },
                [&] {
                    char word;
                    return read(down[0], &word, 1) == 1;
                });
            _exit(0);
        }
        close(up[1]);
        close(down[0]);
        hear_ = up[0];
        tell_ = down[1];
    }
    Child(const Child&) = delete;
    Child& operator=(const Child&) = delete;
    ~Child() {
        end();
        close(hear_);
        close(tell_);
    }
    /// Waits for a word; 0 when the process has ended.
    char hearWord() {
        char word = 0;
        return read(hear_, &word, 1) == 1 ? word : '\0';
    }
    bool hear() { return hearWord() != '\0'; }
    void tell() {
        if (write(tell_, "x", 1) != 1) ADD_FAILURE() << "the other process is gone";
    }
    void kill() {
        ::kill(process_, SIGKILL);
        end();
    }
    void end() {
        if (process_ <= 0) return;
        waitpid(process_, nullptr, 0);
        process_ = 0;
    }

 private:
    pid_t process_;
    int hear_, tell_;
};

}  // namespace test
