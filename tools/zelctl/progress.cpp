#include "progress.h"

#include <cstdio>

#ifdef _WIN32
#include <io.h>
#else
#include <unistd.h>
#endif

namespace zelctl {

bool stderrIsTerminal()
{
#ifdef _WIN32
    return _isatty(_fileno(stderr)) != 0;
#else
    return isatty(fileno(stderr)) != 0;
#endif
}

ProgressBar::ProgressBar(const std::string& label, bool wanted) : label_(label), active_(wanted && stderrIsTerminal())
{}

void ProgressBar::start()
{
    started_ = true;
    draw(0);
}

void ProgressBar::position(unsigned bytesSoFar) { draw(bytesSoFar); }

void ProgressBar::finish()
{
    if (!active_ || !started_)
        return;
    draw(total_);
    std::fputc('\n', stderr);
    std::fflush(stderr);
    started_ = false;
}

void ProgressBar::draw(unsigned bytes)
{
    if (!active_)
        return;
    constexpr int kWidth = 30;
    // An unknown total (0) still shows the bytes moved; the bar then stays empty.
    const int percent = total_ == 0 ? 0 : static_cast<int>(bytes * 100.0 / total_);
    if (percent == lastPercent_ && bytes != 0 && bytes != total_)
        return;
    lastPercent_ = percent;
    const int filled = percent * kWidth / 100;
    std::string bar(static_cast<std::size_t>(filled), '#');
    bar.resize(kWidth, '.');
    std::fprintf(stderr, "\r%s [%s] %3d%% %u bytes", label_.c_str(), bar.c_str(), percent, bytes);
    std::fflush(stderr);
}

}  // namespace zelctl
