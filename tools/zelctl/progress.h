#pragma once
// The transfer progress line, drawn on standard error through the library's progress listener: bytes
// done and in all, the rate and the time left. It draws only on a terminal, so scripts and pipes see
// nothing of it.

#include <zelserverapi/interfaces.h>

#include <chrono>
#include <string>

namespace zelctl {

class ProgressBar final : public IZELServerProgressListener {
public:
    // Draws only when `wanted` (not --quiet) and standard error is a terminal.
    ProgressBar(const std::string& label, bool wanted);

    void totalSize(unsigned bytes) override { total_ = bytes; }
    void start() override;
    void position(unsigned bytesSoFar) override;
    void finish() override;

private:
    void draw(unsigned bytes, bool last);

    std::string label_;
    bool active_;
    bool started_ = false;
    unsigned total_ = 0;
    std::chrono::steady_clock::time_point begun_;
    std::chrono::steady_clock::time_point drawn_;
};

// True when standard error is a terminal.
bool stderrIsTerminal();

// A byte count as people read it: "512 B", "1.5 KiB", "3.2 MiB", "1.1 GiB".
std::string bytesText(double bytes);

}  // namespace zelctl
