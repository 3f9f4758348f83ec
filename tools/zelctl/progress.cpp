#include "progress.h"

#include <cstdio>
#include <filesystem>

#include <unistd.h>

namespace zelctl {

namespace {

using Clock = std::chrono::steady_clock;

// Often enough to look alive, rarely enough not to cost the transfer anything.
constexpr auto kRedraw = std::chrono::milliseconds(100);

}  // namespace

bool stderrIsTerminal() { return isatty(fileno(stderr)) != 0; }

std::string bytesText(double bytes)
{
    const char* const units[] = {"B", "KiB", "MiB", "GiB"};
    int unit = 0;
    while (bytes >= 1024 && unit < 3) {
        bytes /= 1024;
        ++unit;
    }
    char text[32];
    std::snprintf(text, sizeof text, unit == 0 ? "%.0f %s" : "%.1f %s", bytes, units[unit]);
    return text;
}

// The file's name alone: a long path would push the figures off the line.
ProgressBar::ProgressBar(const std::string& label, bool wanted)
    : label_(std::filesystem::path(label).filename().string()), active_(wanted && stderrIsTerminal())
{}

void ProgressBar::start()
{
    started_ = true;
    begun_ = Clock::now();
    draw(0, false);
}

void ProgressBar::position(unsigned bytesSoFar) { draw(bytesSoFar, false); }

void ProgressBar::finish()
{
    if (!active_ || !started_)
        return;
    draw(total_, true);
    std::fputc('\n', stderr);
    std::fflush(stderr);
    started_ = false;
}

void ProgressBar::draw(unsigned bytes, bool last)
{
    const Clock::time_point now = Clock::now();
    if (!active_ || (!last && bytes != 0 && now - drawn_ < kRedraw))
        return;
    drawn_ = now;
    const double seconds = std::chrono::duration<double>(now - begun_).count();
    const double rate = seconds > 0 ? bytes / seconds : 0;
    std::string line = "\r" + label_;
    // An unknown total (0) still shows the bytes moved and the rate.
    if (total_ != 0)
        line += " " + std::to_string(static_cast<int>(bytes * 100.0 / total_)) + "% " + bytesText(bytes) + " of " +
                bytesText(total_);
    else
        line += " " + bytesText(bytes);
    if (rate > 0)
        line += ", " + bytesText(rate) + "/s";
    if (total_ != 0 && rate > 0 && !last)
        line += ", " + std::to_string(static_cast<long>((total_ - bytes) / rate + 0.5)) + " s left";
    line += "\033[K";
    std::fputs(line.c_str(), stderr);
    std::fflush(stderr);
}

}  // namespace zelctl
