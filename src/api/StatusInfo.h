#pragma once
// The internal error record: a type, a message and a trail of stack frames, newest first. Made by
// the message start-up and fill-in routines for their own failures; never handed to clients.
// Each frame added to any record is also copied into the process-wide last-error record.

#include <string>

#include "api/heap.h"

namespace zel {

class StatusInfo : public HeapObject {
public:
    static constexpr unsigned kDefaultType = 16;

    // The defaults: type 16, placeholder message and stack trace, number 0, flag 0.
    StatusInfo();
    // Type and message, number -1, and a first frame built from the function, file and line.
    StatusInfo(unsigned type, std::string message, const std::string& function, int line,
               const std::string& sourceFile);
    StatusInfo(const StatusInfo&) = default;
    StatusInfo& operator=(const StatusInfo&) = default;
    virtual ~StatusInfo() = default;

    // Puts a frame "function(sourceFile:line)" in front of the trail, joined by " - "; an empty
    // source file leaves just the function name. Then refreshes the last-error record.
    void addFrame(const std::string& function, int line, const std::string& sourceFile);

    unsigned type() const { return type_; }
    const std::string& message() const { return message_; }
    const std::string& stackTrace() const { return stackTrace_; }
    int number() const { return number_; }
    unsigned char flag() const { return flag_; }

private:
    unsigned type_ = kDefaultType;
    std::string message_;
    std::string stackTrace_;
    int number_ = 0;
    unsigned char flag_ = 0;
};

// A copy of the last-error record, taken under the process-wide scope lock.
StatusInfo lastStatusInfo();

// The diagnostic hook: empty unless set; when set, every fully constructed record reports
// "BADNEWS: " + message + " " + stack trace through it. Returns the previous hook.
using DiagnosticHook = void (*)(const char* text);
DiagnosticHook setDiagnosticHook(DiagnosticHook hook);

}  // namespace zel
