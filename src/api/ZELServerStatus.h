#pragma once
// The library's status object: a catalogue number, its filled-in text and a secondary code.
// Made through the factories of api/status.h; the caller owns it and destroys it through its
// virtual destructor (IZELServerSession::destroyStatus).
//
// Making one starts the process-wide message database from the library's home directory and keeps
// a token for it; destroying a status that holds the token destroys the database again, so the
// next status reads the catalogue afresh. When the catalogue cannot be read, or has no text for the
// number, the text is "Could not load resource: " followed by the number.

#include <zelserverapi/IZELServerStatus.h>

#include <memory>
#include <source_location>
#include <string>
#include <vector>

#include "api/heap.h"

namespace zel {

class MessageDatabaseToken;

class ZELServerStatus final : public IZELServerStatus, public HeapObject {
public:
    // `where` is the place in the library that made the status (see where()).
    ZELServerStatus(unsigned number, const std::vector<std::string>& parameters,
                    std::source_location where = std::source_location::current());
    ZELServerStatus(unsigned code, unsigned number, const std::vector<std::string>& parameters,
                    std::source_location where = std::source_location::current());
    ~ZELServerStatus() override;

    ZELServerStatus(const ZELServerStatus&) = delete;
    ZELServerStatus& operator=(const ZELServerStatus&) = delete;

    const char* getMessage() const override { return message_.c_str(); }
    unsigned getMessageNumber() const override { return number_; }
    unsigned getCode() const override { return code_; }

    // Where the library made this status: for tests and debugging only, never part of the text.
    const std::source_location& where() const { return where_; }

    // True while this status keeps the process-wide database alive.
    bool holdsDatabaseToken() const { return token_ != nullptr; }

private:
    void build(const std::vector<std::string>& parameters);

    std::string message_;
    unsigned number_ = 0;
    unsigned code_ = 0;
    std::source_location where_;
    bool databaseStarted_ = false;
    std::unique_ptr<MessageDatabaseToken> token_;
};

}  // namespace zel
