#pragma once
// The one way every slot of the public interface keeps exceptions inside the library: its work runs
// through guarded(), so that no exception crosses the interface. std::bad_alloc goes to the heap's
// out-of-memory routine (which normally ends the process, as for the library's own allocations);
// should that routine return, or the exception be of another kind, the slot fails the way it fails
// for any other reason:
//   - a slot that returns a status returns the status of the exception (393625 with its text);
//   - any other slot returns its type's empty value (null, 0, false) or, returning nothing, nothing.
//
//     IZELServerStatus* Session::disconnect()
//     {
//         return guarded([&] { return channel_ ? channel_->close() : nullptr; });
//     }
//     void Service::setName(const IZELServerString& name)
//     {
//         guarded([&] { fields_.name = toStdString(name); });
//     }
//
// A getter that only hands out a text it holds calls handOutText (ZELServerString.h), this guard
// around copyText. A slot that only reads a number or a pointer it holds cannot throw, and one that
// only forwards to a slot guarding itself need not guard again: both are written without it.

#include <type_traits>

#include <zelserverapi/IZELServerStatus.h>

namespace zel {

// The status for the exception being handled: 393625 with its text. Calls the out-of-memory routine
// first for std::bad_alloc. Null when even the status cannot be made. Call only inside a catch block.
IZELServerStatus* statusOfCurrentException() noexcept;

template <class Work>
auto guarded(Work&& work) noexcept -> decltype(work())
{
    using Result = decltype(work());
    try {
        return work();
    } catch (...) {
        if constexpr (std::is_same_v<Result, IZELServerStatus*>) {
            return statusOfCurrentException();
        } else {
            delete statusOfCurrentException();
            if constexpr (!std::is_void_v<Result>) {
                return Result{};
            }
        }
    }
}

}  // namespace zel
