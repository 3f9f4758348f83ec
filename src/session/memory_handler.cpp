// The out-of-memory entry point. The routine it installs runs inside a failed allocation, so it
// allocates nothing: the report is formatted into a static buffer.

#include <zelserverapi/zelserverapi.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "api/heap.h"

namespace {

constexpr std::size_t kPluginNameLength = 200;
constexpr int kReportSeverity = 3;

// Guards the sink and the name; the routine formats its report under it so a concurrent
// DllSetMemoryErrorHandler cannot hand it half a name.
std::mutex handlerMutex;
IZELLogSink* logSink = nullptr;
char pluginName[kPluginNameLength + 1] = {};
std::atomic<bool> notYetReported{true};
char reportBuffer[512];

[[noreturn]] void reportOutOfMemory(int errorCode)
{
    IZELLogSink* sink = nullptr;
    {
        std::lock_guard<std::mutex> lock(handlerMutex);
        // Only the first exhaustion is worth a message: a second one comes from a process that is
        // already on its way out, typically from the host's log itself running short while it
        // writes the first report.
        if (logSink != nullptr && notYetReported.exchange(false)) {
            std::snprintf(reportBuffer, sizeof reportBuffer,
                          "Insufficient memory available -- error code was %d. Offending plug-in is '%s'", errorCode,
                          pluginName);
            sink = logSink;
        }
    }
    // The sink is called without the lock, so that an allocation failing inside it comes back here
    // and ends the process instead of waiting for a lock its own thread holds.
    if (sink != nullptr) {
        sink->logMessageString(reportBuffer, kReportSeverity);
    }
    std::exit(1);
}

}  // namespace

extern "C" ZEL_API ZELMemoryFailureRoutine DllSetMemoryErrorHandler(IZELLogSink* sink, const char* name)
{
    {
        std::lock_guard<std::mutex> lock(handlerMutex);
        logSink = sink;
        if (name == nullptr) {
            pluginName[0] = '\0';
        } else {
            std::strncpy(pluginName, name, kPluginNameLength);
            pluginName[kPluginNameLength] = '\0';
        }
    }
    return zel::heap::setFailureRoutine(&reportOutOfMemory);
}
