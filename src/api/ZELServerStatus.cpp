#include "api/ZELServerStatus.h"

#include "api/StatusInfo.h"
#include "api/ZELServerStringArray.h"
#include "session/home_directories.h"
#include "session/message_startup.h"

namespace zel {

ZELServerStatus::ZELServerStatus(unsigned number) : number_(number) { build({}); }

ZELServerStatus::ZELServerStatus(unsigned number, const std::vector<std::string>& parameters) : number_(number)
{
    build(parameters);
}

ZELServerStatus::ZELServerStatus(unsigned number, const std::string& parameter) : number_(number)
{
    build({parameter});
}

ZELServerStatus::ZELServerStatus(unsigned code, unsigned number) : number_(number), code_(code) { build({}); }

ZELServerStatus::ZELServerStatus(unsigned code, unsigned number, const std::string& parameter)
    : number_(number), code_(code)
{
    build({parameter});
}

// The token's destructor tears the process-wide database down.
ZELServerStatus::~ZELServerStatus() = default;

void ZELServerStatus::startDatabase()
{
    if (databaseStarted_) {
        return;
    }
    databaseStarted_ = true;
    token_.reset(new MessageDatabaseToken);
    const std::unique_ptr<StatusInfo> failure(startMessageDatabase(serverLibraryHomeDirectory()));
    if (failure) {
        // Dropping the token destroys the database, should another status have left one behind.
        if (token_) {
            token_.reset();
        } else {
            destroyMessageDatabase();
        }
    }
}

void ZELServerStatus::build(const std::vector<std::string>& parameters)
{
    startDatabase();
    message_ = "Could not load resource: " + std::to_string(number_);
    // Without the library's own catalogue the status keeps the fallback text: looking further (the
    // fill-in would try the framework home) could give a text from another installation.
    if (!token_) {
        return;
    }
    const ZELServerStringArray parameterList(parameters);
    std::string filled;
    const std::unique_ptr<StatusInfo> failure(fillInMessage(number_, &parameterList, filled, false));
    // An empty text is no message at all; the number still tells the client what happened.
    if (!failure && !filled.empty()) {
        message_ = std::move(filled);
    }
}

}  // namespace zel
