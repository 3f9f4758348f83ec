// One line per command on standard error (or another stream), serialised across threads.
#pragma once

#include <cstdio>
#include <mutex>
#include <string>
#include <string_view>

namespace zelserverd {

class Logger {
public:
    Logger(std::FILE* out, bool quiet) : out_(out), quiet_(quiet) {}
    void command(std::string_view user, std::string_view keyword, std::string_view outcome, double milliseconds,
                 std::string_view detail = {});
    void info(std::string_view message);

private:
    void write(const std::string& line);

    std::FILE* out_;
    bool quiet_;
    std::mutex mutex_;
};

}  // namespace zelserverd
