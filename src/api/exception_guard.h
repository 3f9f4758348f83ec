#pragma once
// Every operation a client calls runs its work through one of these, so that no exception crosses
// the interface: std::bad_alloc goes to the heap's out-of-memory routine (which normally ends the
// process, as for the library's own allocations), and should that routine return, or the exception
// be of another kind, the operation fails the way it fails for any other reason.
//
//     IZELServerStatus* Session::disconnect()
//     {
//         return guardStatus([&] { return channel_ ? channel_->close() : nullptr; });
//     }

#include <zelserverapi/IZELServerStatus.h>

namespace zel {

// The status for the exception being handled: 393625 with its text. Calls the out-of-memory routine
// first for std::bad_alloc. Null when even the status cannot be made. Call only inside a catch block.
IZELServerStatus* statusOfCurrentException() noexcept;

template <class Work>
IZELServerStatus* guardStatus(Work&& work) noexcept
{
    try {
        return work();
    } catch (...) {
        return statusOfCurrentException();
    }
}

// For operations without a status: `fallback` is what the caller receives on failure.
template <class Result, class Work>
Result guardValue(Result fallback, Work&& work) noexcept
{
    try {
        return work();
    } catch (...) {
        delete statusOfCurrentException();
        return fallback;
    }
}

// For operations that return nothing.
template <class Work>
void guardVoid(Work&& work) noexcept
{
    try {
        work();
    } catch (...) {
        delete statusOfCurrentException();
    }
}

}  // namespace zel
