#pragma once
// Timing, medians, the process's memory and the machine's state, and the result table.

#include <chrono>
#include <functional>
#include <string>
#include <vector>

namespace bench {

// Seconds `work` takes, on the monotonic clock.
double secondsOf(const std::function<void()>& work);

double median(std::vector<double> values);

// Runs `library` and `raw` alternately `rounds` times each, the first of each pair taking turns
// (A B, B A, A B, ...) so that neither side always runs on the state the other left behind (a page
// cache just filled or a file just deleted). `after`, if given, runs untimed after every run (a check
// of what arrived). The samples are the seconds of each run.
struct Samples {
    std::vector<double> library, raw;
};
Samples interleave(unsigned rounds, const std::function<void()>& library, const std::function<void()>& raw,
                   const std::function<void()>& after = {});

// Keeps the calling thread, and every process and thread it starts meanwhile, on one CPU until
// destroyed or released. On a small virtual machine a wake-up on another core costs about 30 µs and
// comes and goes with where the scheduler happens to place the server's thread, run by run: with
// client and server sharing one CPU each figure compares the work both sides do, not their luck.
class OneCpu {
public:
    OneCpu();
    ~OneCpu() { release(); }
    OneCpu(const OneCpu&) = delete;
    OneCpu& operator=(const OneCpu&) = delete;
    void release();
    // "CPU 0", or why the placement was left to the scheduler.
    const std::string& text() const { return text_; }

private:
    bool pinned_ = false;
    std::vector<unsigned char> saved_;  // the cpu_set_t before pinning
    std::string text_;
};

// Resident set size and its peak since the last resetPeakResident(), in bytes (Linux /proc).
long residentBytes();
long peakResidentBytes();
void resetPeakResident();

// "nproc 2, kernel 6.1.0-18-amd64" and the load averages "0.52 0.61 0.70".
std::string machineText();
std::string loadText();

// One row of the result table; `met` is "yes", "NO", or empty for a figure without a goal.
struct Row {
    std::string figure, library, raw, ratio, goal, met;
};
inline std::string metText(bool met) { return met ? "yes" : "NO"; }
void printTable(const std::vector<Row>& rows, const std::string& loadBefore, const std::string& loadAfter);

std::string fixed(double value, int decimals);

}  // namespace bench
