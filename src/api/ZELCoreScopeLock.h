#pragma once
// A scope lock over the one process-wide mutex that guards the last-error record of StatusInfo.
// It is the library's own guard: every holder shares the same mutex, so two holders on different
// threads exclude each other and the record is always copied as one unit.

#include <mutex>

namespace zel {

class ZELCoreScopeLock {
public:
    ZELCoreScopeLock() : lock_(mutex()) {}
    ZELCoreScopeLock(const ZELCoreScopeLock&) = delete;
    ZELCoreScopeLock& operator=(const ZELCoreScopeLock&) = delete;

private:
    // A function-local static is built on first use, so taking the lock during the static set-up of
    // another translation unit is safe.
    static std::mutex& mutex()
    {
        static std::mutex processMutex;
        return processMutex;
    }

    std::lock_guard<std::mutex> lock_;
};

}  // namespace zel
