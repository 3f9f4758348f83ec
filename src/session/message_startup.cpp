#include "session/message_startup.h"

#include <memory>
#include <mutex>

#include "api/StatusInfo.h"
#include "api/string_adapters.h"
#include "platform/environment.h"
#include "session/ZELLocalizedMessageDatabase.h"
#include "session/home_directories.h"

namespace zel {
namespace {

std::mutex databaseMutex;
// Guarded by databaseMutex.
ZELLocalizedMessageDatabase* database = nullptr;
bool showNumbers = false;

StatusInfo* startUpFailure(const std::string& text)
{
    return new StatusInfo(StatusInfo::kDefaultType, text, std::string(), kStartUpFailedLine, kMessageSourceFile);
}

// Returns the failure record, or null when the database exists afterwards. (When even the record
// cannot be allocated the caller sees null with the database still absent.)
StatusInfo* startLocked(const std::string& homeDirectory)
{
    StatusInfo* failure = nullptr;
    if (database == nullptr) {
        std::unique_ptr<ZELLocalizedMessageDatabase> created(new ZELLocalizedMessageDatabase);
        if (!created) {
            failure = startUpFailure("Insufficient memory for the message database");
        } else if (!created->initialize(homeDirectory)) {
            failure = startUpFailure(created->getLastErrorMessage());
        } else {
            database = created.release();
        }
    }
    if (platform::getEnvironmentVariable("ZEL_MSG_NUM_OUTPUT").has_value()) {
        showNumbers = true;
    }
    return failure;
}

}  // namespace

StatusInfo* startMessageDatabase(const std::string& homeDirectory)
{
    std::lock_guard<std::mutex> lock(databaseMutex);
    return startLocked(homeDirectory);
}

void destroyMessageDatabase()
{
    std::lock_guard<std::mutex> lock(databaseMutex);
    delete database;
    database = nullptr;
}

bool messageDatabaseStarted()
{
    std::lock_guard<std::mutex> lock(databaseMutex);
    return database != nullptr;
}

bool showMessageNumbers()
{
    std::lock_guard<std::mutex> lock(databaseMutex);
    return showNumbers;
}

LibraryMessage fillInLibraryMessage(const std::string& homeDirectory, unsigned number,
                                    const IZELServerStringArray* parameters, std::string& output)
{
    std::lock_guard<std::mutex> lock(databaseMutex);
    delete startLocked(homeDirectory);
    if (database == nullptr) {
        return {};
    }
    const ZELROStringArrayWrapper wrappedParameters(parameters);
    ZELObsoleteStringImp filled;
    if (!database->createFilledInMessage(number, &wrappedParameters, &filled, false, showNumbers)) {
        return {true, false};
    }
    output = filled.str();
    return {true, true};
}

StatusInfo* fillInMessage(unsigned number, const IZELServerStringArray* parameters, std::string& output,
                          bool callerFlag)
{
    // Lock order is always the database's, then the framework home search's.
    std::lock_guard<std::mutex> lock(databaseMutex);
    if (database == nullptr) {
        StatusInfo* failure = startLocked(frameworkHomeDirectory());
        if (failure != nullptr) {
            failure->addFrame(std::string(), kFillInStartUpFailedLine, kMessageSourceFile);
            return failure;
        }
        if (database == nullptr) {
            // Memory ran out for the record as well: nothing was written, and the caller keeps its
            // fallback text.
            return nullptr;
        }
    }
    const ZELROStringArrayWrapper wrappedParameters(parameters);
    ZELObsoleteStringImp filled;
    if (!database->createFilledInMessage(number, &wrappedParameters, &filled, callerFlag, showNumbers)) {
        return new StatusInfo(StatusInfo::kDefaultType, database->getLastErrorMessage(), std::string(),
                              kFillInFailedLine, kMessageSourceFile);
    }
    output = filled.str();
    return nullptr;
}

}  // namespace zel
