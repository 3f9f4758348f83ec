#include "measure.h"

#include <sched.h>

#include <sys/utsname.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <fstream>
#include <sstream>

namespace bench {
namespace {

long statusField(const char* name)
{
    std::ifstream status("/proc/self/status");
    std::string line;
    const std::string prefix = std::string(name) + ":";
    while (std::getline(status, line)) {
        if (line.compare(0, prefix.size(), prefix) == 0) {
            return std::stol(line.substr(prefix.size())) * 1024;  // the kernel writes kB
        }
    }
    return -1;
}

}  // namespace

double secondsOf(const std::function<void()>& work)
{
    const auto start = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

double median(std::vector<double> values)
{
    if (values.empty()) {
        return 0;
    }
    std::sort(values.begin(), values.end());
    const std::size_t mid = values.size() / 2;
    return values.size() % 2 != 0 ? values[mid] : (values[mid - 1] + values[mid]) / 2;
}

Samples interleave(unsigned rounds, const std::function<void()>& library, const std::function<void()>& raw,
                   const std::function<void()>& after)
{
    Samples samples;
    const auto timed = [&](const std::function<void()>& work, std::vector<double>& into) {
        into.push_back(secondsOf(work));
        if (after) {
            after();
        }
    };
    for (unsigned i = 0; i < rounds; ++i) {
        if (i % 2 == 0) {
            timed(library, samples.library);
            timed(raw, samples.raw);
        } else {
            timed(raw, samples.raw);
            timed(library, samples.library);
        }
    }
    return samples;
}

OneCpu::OneCpu() : saved_(sizeof(cpu_set_t))
{
    auto* before = reinterpret_cast<cpu_set_t*>(saved_.data());
    if (::sched_getaffinity(0, sizeof(cpu_set_t), before) != 0) {
        text_ = "left to the scheduler (no affinity mask)";
        return;
    }
    int first = 0;
    while (first < CPU_SETSIZE && !CPU_ISSET(first, before)) {
        ++first;
    }
    cpu_set_t one;
    CPU_ZERO(&one);
    CPU_SET(first, &one);
    pinned_ = first < CPU_SETSIZE && ::sched_setaffinity(0, sizeof one, &one) == 0;
    text_ = pinned_ ? "CPU " + std::to_string(first) : "left to the scheduler (cannot pin)";
}

void OneCpu::release()
{
    if (pinned_) {
        ::sched_setaffinity(0, sizeof(cpu_set_t), reinterpret_cast<const cpu_set_t*>(saved_.data()));
        pinned_ = false;
    }
}

long residentBytes() { return statusField("VmRSS"); }

long peakResidentBytes() { return statusField("VmHWM"); }

void resetPeakResident()
{
    // "5" resets the peak resident size the kernel keeps for this process.
    std::ofstream("/proc/self/clear_refs") << "5";
}

std::string machineText()
{
    utsname name{};
    ::uname(&name);
    return "nproc " + std::to_string(::sysconf(_SC_NPROCESSORS_ONLN)) + ", kernel " + name.release + " " + name.machine;
}

std::string loadText()
{
    std::ifstream file("/proc/loadavg");
    std::string one, five, fifteen;
    file >> one >> five >> fifteen;
    return one + " " + five + " " + fifteen;
}

std::string fixed(double value, int decimals)
{
    char text[64];
    std::snprintf(text, sizeof text, "%.*f", decimals, value);
    return text;
}

void printTable(const std::vector<Row>& rows, const std::string& loadBefore, const std::string& loadAfter)
{
    std::printf("\n| Figure | Library | Raw, same bytes | Ratio | Goal | Met |\n|---|---|---|---|---|---|\n");
    for (const Row& row : rows) {
        std::printf("| %s | %s | %s | %s | %s | %s |\n", row.figure.c_str(), row.library.c_str(), row.raw.c_str(),
                    row.ratio.c_str(), row.goal.c_str(), row.met.c_str());
    }
    std::printf("\nmachine: %s; load average (1, 5, 15 min) before %s, after %s\n", machineText().c_str(),
                loadBefore.c_str(), loadAfter.c_str());
}

}  // namespace bench
