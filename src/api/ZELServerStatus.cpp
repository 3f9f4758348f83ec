#include "api/ZELServerStatus.h"

#include "api/ZELServerStringArray.h"
#include "session/home_directories.h"
#include "session/message_startup.h"

namespace zel {

ZELServerStatus::ZELServerStatus(unsigned number, const std::vector<std::string>& parameters,
                                 std::source_location where)
    : ZELServerStatus(0, number, parameters, where)
{}

ZELServerStatus::ZELServerStatus(unsigned code, unsigned number, const std::vector<std::string>& parameters,
                                 std::source_location where)
    : number_(number), code_(code), where_(where)
{
    build(parameters);
}

// The token's destructor tears the process-wide database down.
ZELServerStatus::~ZELServerStatus() = default;

void ZELServerStatus::build(const std::vector<std::string>& parameters)
{
    message_ = "Could not load resource: " + std::to_string(number_);
    databaseStarted_ = true;
    token_.reset(new MessageDatabaseToken);
    // Without a token nothing would tear the database down again, so it is not started.
    if (!token_) {
        return;
    }
    const ZELServerStringArray parameterList(parameters);
    std::string filled;
    const LibraryMessage result = fillInLibraryMessage(serverLibraryHomeDirectory(), number_, &parameterList, filled);
    // Without the library's own catalogue the status keeps the fallback text, and dropping the token
    // destroys a database that another status may have left behind.
    if (!result.started) {
        token_.reset();
        return;
    }
    // An empty text is no message at all; the number still tells the client what happened.
    if (result.filled && !filled.empty()) {
        message_ = std::move(filled);
    }
}

}  // namespace zel
