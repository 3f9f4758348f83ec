#pragma once
// The one connection of a session: opens it and signs in, frames every command and its reply, moves
// files alongside a command, and runs the result-port exchange in which the server calls back.
// Owned by the session; managers and bound objects hold it without owning it. One command at a time:
// replies are matched to requests only by their order on the connection.

#include <string>

#include <zelserverapi/IZELServerConnectionInfo.h>
#include <zelserverapi/IZELServerProgressListener.h>
#include <zelserverapi/IZELServerStatus.h>
#include <zelserverapi/IZELServerStringArray.h>

class IZELServerIdentity;

namespace zel {

class IZELServerRequest;
class IZELServerResponse;
class LocalFile;

// Request types of sendRequest.
inline constexpr unsigned kPlainRequest = 0;
inline constexpr unsigned kPlainRequestAlias = 1;
inline constexpr unsigned kResultPortRequest = 2;

// Directions of transferFile.
inline constexpr unsigned kUpload = 0;
inline constexpr unsigned kDownload = 1;

class IZELServerChannel {
public:
    // Connects (or keeps a live connection) and signs in with "SERVER_SESSION_INIT". `options` is an
    // optional flat pair list ("CLIENT_ID", "TRUSTED_HOST_NAMES"). Null, 393601 (cannot connect),
    // 393631 (sign-in refused or unreadable), or the exchange's status.
    virtual IZELServerStatus* open(const IZELServerConnectionInfo& info, const IZELServerStringArray* options) = 0;
    // Drops the connection. Null, or 393622 when there is none.
    virtual IZELServerStatus* close() = 0;
    // A new request for `keyword` carrying the identity and "clientID", with the directive and
    // notification pair lists kept for the result-port exchange.
    virtual IZELServerRequest* createRequest(const std::string& keyword, const IZELServerStringArray& directives,
                                             const IZELServerStringArray& notifications) = 0;
    virtual IZELServerRequest* createRequest(const std::string& keyword) = 0;
    virtual IZELServerResponse* createResponse() = 0;
    // Direction kUpload sends the local file with the command. Direction kDownload receives the file
    // into a temporary file beside `localPath` (receiveIntoTemporary in command.h), which replaces
    // `localPath` only when a whole file came and the exchange succeeded: a failed one leaves
    // `localPath` as it was. The final answer is not read here (a reply without a file succeeds with
    // the answer in the response and `localPath` untouched).
    virtual IZELServerStatus* transferFile(IZELServerRequest& request, IZELServerResponse& response,
                                           const std::string& localPath, unsigned direction,
                                           IZELServerProgressListener* progress) = 0;
    // kPlainRequest (or kPlainRequestAlias): one exchange; kResultPortRequest: the server answers on a
    // connection to a port this side listens on.
    virtual IZELServerStatus* sendRequest(IZELServerRequest& request, IZELServerResponse& response,
                                          unsigned requestType) = 0;
    // One exchange with at most one of an upload or a download file (null for none). The files are
    // opened by the caller, so a local file that cannot be opened is reported before anything is sent.
    virtual IZELServerStatus* exchange(IZELServerRequest& request, IZELServerResponse& response, LocalFile* upload,
                                       LocalFile* download, IZELServerProgressListener* progress) = 0;
    virtual void destroyRequest(IZELServerRequest* request) = 0;
    virtual void destroyResponse(IZELServerResponse* response) = 0;
    // The identity received at sign-in (owned by the channel; null before).
    virtual IZELServerIdentity* getIdentity() = 0;
    virtual ~IZELServerChannel() = default;

protected:
    IZELServerChannel() = default;
};

}  // namespace zel
