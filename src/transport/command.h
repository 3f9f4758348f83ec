#pragma once
// One server command, the only way a manager talks to the channel: it makes the request and the
// response, lets the caller add named values, runs the exchange and reads the body, and hands both
// back to the channel when it goes out of scope, on success and on failure alike.
//
//     Command command(channel, "ABORT_JOB_REQUEST");
//     command.add("jobID", jobIdText(jobId));
//     return command.send();
//
// A Command that could not make its request or response (memory exhausted) adds nothing, and its
// send() and transfer() return a status without touching the connection.

#include <cstdint>
#include <optional>
#include <string>

#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerStatus.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

#include "transport/IZELServerChannel.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"
#include "transport/temporary_file.h"

namespace zel {

// Where a downloaded file goes and what names it in a status.
struct DownloadTarget {
    std::string destination;      // the caller's file; empty: the file stays under its temporary name
    std::string source;           // what the server was asked for (393638 names it)
    bool emptyIsMissing = false;  // a file of no bytes counts as no file
};

// What receiveIntoTemporary reports when the server sent no file.
inline constexpr std::uint64_t kNoFileArrived = ~std::uint64_t{0};

// The first half of every download, shared by Command::receive and the channel's transferFile: one
// exchange whose file is received into a new temporary file beside `destination` (see
// TemporaryFile::createBeside), which `temporary` holds afterwards; the caller decides whether it
// replaces the destination. `arrived` is the number of bytes of a file that came complete, or
// kNoFileArrived. 393624 (the destination, or the folder for temporary files when it is empty)
// when the temporary file cannot be made or the destination is a folder, with nothing sent;
// otherwise the exchange's status.
IZELServerStatus* receiveIntoTemporary(IZELServerChannel& channel, IZELServerRequest& request,
                                       IZELServerResponse& response, const std::string& destination,
                                       IZELServerProgressListener* progress, std::optional<TemporaryFile>& temporary,
                                       std::uint64_t& arrived);

class Command {
public:
    // `channel` is borrowed and must outlive the command.
    Command(IZELServerChannel& channel, const std::string& keyword);
    // The request also keeps the two pair lists for the result-port exchange (kResultPortRequest).
    Command(IZELServerChannel& channel, const std::string& keyword, const IZELServerStringArray& directives,
            const IZELServerStringArray& notifications);
    ~Command();

    Command(const Command&) = delete;
    Command& operator=(const Command&) = delete;

    // Whether both the request and the response exist.
    bool ready() const { return request_ != nullptr && response_ != nullptr; }

    // Named values, appended in call order. Each returns the command for chaining.
    Command& add(const std::string& name, const std::string& value);
    Command& add(const std::string& name, const IZELServerString& value);
    Command& addBoolean(const std::string& name, unsigned flag);
    // Each (name, value) pair of the flat list as its own named value; `name` itself is not written.
    Command& addList(const std::string& name, const IZELServerStringArray& pairs);

    // The request itself, for what the helpers above do not cover (XML payloads, the pair lists of
    // the result-port exchange). Only valid when ready().
    IZELServerRequest& request() { return *request_; }

    // sendRequest with the given type: null, or the channel's status (a new object the caller owns).
    IZELServerStatus* send(unsigned requestType = kPlainRequest);
    // transferFile with the given direction; the channel opens `localPath` itself.
    IZELServerStatus* transfer(const std::string& localPath, unsigned direction,
                               IZELServerProgressListener* progress = nullptr);

    // The one way a file comes down. It is received into a temporary file beside the destination and
    // moved onto the destination only after a complete, successful exchange, so a failed download
    // never truncates, empties or deletes what the destination held:
    //  - the temporary file cannot be made: 393624 (the destination), nothing sent;
    //  - the exchange fails: its status (an "ERROR" frame in place of the file: 393625 with the
    //    server's text);
    //  - the server sends no file (or, with emptyIsMissing, an empty one): 393638 naming the source;
    //  - the final reply is "false": success with `received` 0; neither "true" nor "false": 393604;
    //  - "true": the file replaces the destination (393624 when it cannot) and `received` is 1.
    // `received` is written only in the last two cases.
    IZELServerStatus* receive(const DownloadTarget& target, unsigned& received,
                              IZELServerProgressListener* progress = nullptr);

    // The reply body as the exchange left it; empty before an exchange or without a response.
    std::string body() const;
    // The reply itself, for its readers. Only valid when ready().
    const IZELServerResponse& response() const { return *response_; }

private:
    IZELServerStatus* notReady() const;

    IZELServerChannel& channel_;
    IZELServerRequest* request_ = nullptr;
    IZELServerResponse* response_ = nullptr;
};

}  // namespace zel
