#pragma once
// The one process-wide message database: lazy start-up from a home directory, teardown, and the
// fill-in routine through which every status gets its text. All of it is guarded by one mutex, so
// statuses may be made and destroyed on different threads; on one thread the database lives exactly
// from a start-up until the next teardown.

#include <zelserverapi/IZELServerStringArray.h>

#include <string>

#include "api/heap.h"

namespace zel {

class StatusInfo;

// The source file the start-up and fill-in routines name in their records.
inline constexpr const char* kMessageSourceFile = "..\\..\\framework\\engine\\internat";
inline constexpr int kStartUpFailedLine = 100;
inline constexpr int kFillInStartUpFailedLine = 139;
inline constexpr int kFillInFailedLine = 148;

// Starts the database from `homeDirectory` unless it exists already. Returns null on success, or
// an owned record (type 16, line 100) with the catalogue's error text; the database then stays
// absent, so the next call tries again. Either way, a defined "ZEL_MSG_NUM_OUTPUT" turns on the
// show-message-numbers flag for good.
StatusInfo* startMessageDatabase(const std::string& homeDirectory);

// Destroys the database; the next start-up or fill-in reads the files again.
void destroyMessageDatabase();

bool messageDatabaseStarted();
bool showMessageNumbers();

// Fills message `number` with `parameters` (null: none) into `output`. Starts the database from the
// framework home directory when it is absent. Returns null on success, or an owned record: the
// start-up's record with a second frame at line 139, or a record at line 148 with the catalogue's
// error text when the number has no text. `callerFlag` keeps slots without a parameter as written.
// (Should memory run out even for the record, null comes back with `output` untouched.)
StatusInfo* fillInMessage(unsigned number, const IZELServerStringArray* parameters, std::string& output,
                          bool callerFlag);

struct LibraryMessage {
    bool started = false;  // the database exists (it was there, or it was started from the home)
    bool filled = false;   // `output` holds the message
};

// What a status object does to get its text, as one step under the database's lock: start the
// database from the library's `homeDirectory` when it is absent, then fill in message `number`. A
// teardown on another thread comes before or after, never in between, and the text never comes from
// the framework home, whose search would also set the environment from whatever thread got there.
LibraryMessage fillInLibraryMessage(const std::string& homeDirectory, unsigned number,
                                    const IZELServerStringArray* parameters, std::string& output);

// Held by a status object that started the database: destroying the token destroys the database,
// so the database never outlives the last status that used it.
class MessageDatabaseToken : public HeapObject {
public:
    MessageDatabaseToken() = default;
    MessageDatabaseToken(const MessageDatabaseToken&) = delete;
    MessageDatabaseToken& operator=(const MessageDatabaseToken&) = delete;
    ~MessageDatabaseToken() { destroyMessageDatabase(); }
};

}  // namespace zel
