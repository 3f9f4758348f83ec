#include "api/exception_guard.h"

#include <exception>
#include <new>
#include <string>

#include "api/heap.h"
#include "api/message_numbers.h"
#include "api/status.h"

namespace zel {

namespace {

IZELServerStatus* failureStatus(const char* text) noexcept
{
    try {
        return makeStatus(msg::kServerError, std::string(text));
    } catch (...) {
        return nullptr;
    }
}

}  // namespace

IZELServerStatus* statusOfCurrentException() noexcept
{
    try {
        throw;
    } catch (const std::bad_alloc&) {
        heap::reportExhaustion();
        return failureStatus("Not enough memory for the operation.");
    } catch (const std::exception& error) {
        return failureStatus(error.what());
    } catch (...) {
        return failureStatus("The operation failed unexpectedly.");
    }
}

}  // namespace zel
