#include "logger.h"

#include <cstdio>

#include "util.h"

namespace zelserverd {

void Logger::command(std::string_view user, std::string_view keyword, std::string_view outcome, double milliseconds,
                     std::string_view detail)
{
    if (quiet_)
        return;
    char duration[32];
    std::snprintf(duration, sizeof duration, "%.1f", milliseconds);
    std::string line = isoTime(nowSeconds()) + " user=" + std::string(user.empty() ? "-" : user) +
                       " command=" + std::string(keyword) + " outcome=" + std::string(outcome) + " ms=" + duration;
    if (!detail.empty()) {
        // Error texts may come from clients; keep each log entry on one line.
        std::string flat(detail.substr(0, 200));
        for (char& c : flat)
            if (c == '\n' || c == '\r' || c == '\0')
                c = ' ';
        line += " detail=\"" + flat + "\"";
    }
    write(line);
}

void Logger::info(std::string_view message)
{
    if (!quiet_)
        write(isoTime(nowSeconds()) + " " + std::string(message));
}

void Logger::write(const std::string& line)
{
    std::lock_guard lock(mutex_);
    std::fprintf(out_, "%s\n", line.c_str());
    std::fflush(out_);
}

}  // namespace zelserverd
