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

#include <string>

#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerStatus.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

#include "transport/IZELServerChannel.h"
#include "transport/IZELServerRequest.h"
#include "transport/IZELServerResponse.h"

namespace zel {

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

    // transfer() into `localPath` (direction kDownload), then the reply's truth value into
    // `received`; a reply that is none leaves `received` as it was.
    IZELServerStatus* receive(const std::string& localPath, unsigned& received,
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
