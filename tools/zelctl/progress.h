#pragma once
// The transfer progress bar, drawn on standard error through the library's progress listener. It
// draws only on a terminal, so scripts and pipes see nothing of it.

#include <zelserverapi/interfaces.h>

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
    void draw(unsigned bytes);

    std::string label_;
    bool active_;
    bool started_ = false;
    unsigned total_ = 0;
    int lastPercent_ = -1;
};

// True when standard error is a terminal.
bool stderrIsTerminal();

}  // namespace zelctl
