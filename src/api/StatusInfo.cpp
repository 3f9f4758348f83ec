#include "api/StatusInfo.h"

#include <atomic>
#include <utility>

#include "api/ZELCoreScopeLock.h"

namespace zel {
namespace {

// Only ever touched under ZELCoreScopeLock.
StatusInfo& lastErrorRecord()
{
    static StatusInfo record;
    return record;
}

// The record exists from the moment the library is loaded, like every other constant of the
// library, so a copy taken before any failure already reads as the defaults.
[[maybe_unused]] const bool lastErrorRecordBuilt = [] {
    ZELCoreScopeLock lock;
    lastErrorRecord();
    return true;
}();

std::atomic<DiagnosticHook> diagnosticHook{nullptr};

}  // namespace

StatusInfo::StatusInfo()
    : message_("Internal Error -- No Descriptive Message Available"),
      stackTrace_("Internal Error -- No Stack Trace Available")
{}

StatusInfo::StatusInfo(unsigned type, std::string message, const std::string& function, int line,
                       const std::string& sourceFile)
    : type_(type), message_(std::move(message)), number_(-1)
{
    addFrame(function, line, sourceFile);
    if (DiagnosticHook hook = diagnosticHook.load(std::memory_order_acquire)) {
        const std::string report = "BADNEWS: " + message_ + " " + stackTrace_;
        hook(report.c_str());
    }
}

void StatusInfo::addFrame(const std::string& function, int line, const std::string& sourceFile)
{
    std::string frame = function;
    if (!sourceFile.empty()) {
        frame += "(" + sourceFile + ":" + std::to_string(line) + ")";
    }
    if (!stackTrace_.empty()) {
        frame += " - ";
    }
    stackTrace_ = frame + stackTrace_;

    ZELCoreScopeLock lock;
    lastErrorRecord() = *this;
}

StatusInfo lastStatusInfo()
{
    ZELCoreScopeLock lock;
    return lastErrorRecord();
}

DiagnosticHook setDiagnosticHook(DiagnosticHook hook)
{
    return diagnosticHook.exchange(hook, std::memory_order_acq_rel);
}

}  // namespace zel
