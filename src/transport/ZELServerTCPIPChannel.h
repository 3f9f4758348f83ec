#pragma once
// The session's one TCP connection to the server (see IZELServerChannel for the operations).
//
// Statuses returned, each a new object the caller owns:
//   393601 cannot connect, with getCode() the socket code (the failed socket is kept; the next open
//          replaces it)
//   393602 a reply without a NUL or with an empty body (parameter: the reply)
//   393604 a reply whose status word is neither "SUCCESS" nor "ERROR" (parameter: the reply); also a
//          frame longer than the connection's MAX_REPLY_BYTES, refused before its content is read
//   393607 / 393608 send / receive failed (parameter and getCode(): the socket code)
//   393617 a "requesterResultPort" directive that is no port number, or a limit property of the
//          connection that does not convert (parameters: its name and value)
//   393618 the result port could not be opened, or the server did not connect back
//   393622 close, or a command, without a connection
//   393623 / 393624 a local file cannot be read / written (parameter: the path); also 393623 for an
//          upload of 4 GiB or more, whose length the 32-bit header cannot carry
//   393625 the server's "ERROR" text, with getCode() 1 for an authentication error and 2 for an
//          authorization error (their prefix removed) and 0 otherwise; also the channel's own
//          "Invalid arguments to method.", "Unknown request type" and "Invalid transfer direction"
//   393631 the sign-in was not accepted
// A step that ran out of its time-out (connection_limits.h) gives its usual status with getCode()
// 392012 (SOCK_TIMED_OUT). A time-out inside an exchange and a refused frame leave the server in the middle of a
// message, so the connection is then closed.

#include <cstddef>
#include <memory>
#include <string>
#include <string_view>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"
#include "transport/connection_limits.h"

namespace zel {

class TcpSocket;

class ZELServerTCPIPChannel final : public IZELServerChannel, public HeapObject {
public:
    ZELServerTCPIPChannel();
    ~ZELServerTCPIPChannel() override;

    ZELServerTCPIPChannel(const ZELServerTCPIPChannel&) = delete;
    ZELServerTCPIPChannel& operator=(const ZELServerTCPIPChannel&) = delete;

    IZELServerStatus* open(const IZELServerConnectionInfo& info, const IZELServerStringArray* options) override;
    IZELServerStatus* close() override;
    IZELServerRequest* createRequest(const std::string& keyword, const IZELServerStringArray& directives,
                                     const IZELServerStringArray& notifications) override;
    IZELServerRequest* createRequest(const std::string& keyword) override;
    IZELServerResponse* createResponse() override;
    IZELServerStatus* transferFile(IZELServerRequest& request, IZELServerResponse& response,
                                   const std::string& localPath, unsigned direction,
                                   IZELServerProgressListener* progress) override;
    IZELServerStatus* sendRequest(IZELServerRequest& request, IZELServerResponse& response,
                                  unsigned requestType) override;
    IZELServerStatus* exchange(IZELServerRequest& request, IZELServerResponse& response, LocalFile* upload,
                               LocalFile* download, IZELServerProgressListener* progress) override;
    void destroyRequest(IZELServerRequest* request) override;
    void destroyResponse(IZELServerResponse* response) override;
    IZELServerIdentity* getIdentity() override;

private:
    struct Transfer;

    void takeProperties(const IZELServerConnectionInfo& info);
    void takeOptions(const IZELServerStringArray& options);
    IZELServerStatus* connect();
    IZELServerStatus* signIn(const IZELServerConnectionInfo& info);
    void ensureIdentity();
    IZELServerStatus* resultPortExchange(IZELServerRequest& request, IZELServerResponse& response);
    IZELServerStatus* sendAndReceive(std::string_view requestText, Transfer& transfer, std::string& reply);
    IZELServerStatus* receiveAnswer(Transfer& transfer, std::string& reply);
    IZELServerStatus* uploadFile(Transfer& transfer);
    IZELServerStatus* downloadFile(Transfer& transfer, bool& noFile);
    void dropIfOutOfStep(TcpSocket& socket, bool outOfStep);
    IZELServerStatus* sendBytes(TcpSocket& socket, std::string_view bytes);
    IZELServerStatus* sendFrame(TcpSocket& socket, std::string_view payload);
    IZELServerStatus* receiveBytes(TcpSocket& socket, char* buffer, std::size_t count);
    IZELServerStatus* receiveFrame(TcpSocket& socket, std::string& payload);
    IZELServerStatus* receiveAcknowledgement(TcpSocket& socket);

    std::unique_ptr<TcpSocket> socket_;
    std::string host_;
    unsigned short port_ = 0;
    std::unique_ptr<IZELServerIdentity> identity_;
    std::string clientId_;
    std::string trustedHostNames_;
    ConnectionLimits limits_;
};

}  // namespace zel
