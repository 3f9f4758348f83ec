#include "transport/ZELServerTCPIPChannel.h"

#include <algorithm>
#include <cstdint>
#include <limits>
#include <new>
#include <optional>
#include <string_view>
#include <vector>

#include <zelserverapi/IZELServerIdentity.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "api/StringDict.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "api/text_encoding.h"
#include "platform/net.h"
#include "security/ZELServerIdentity.h"
#include "session/ZELServerConnectionInfo.h"
#include "transport/LocalFile.h"
#include "transport/TcpSocket.h"
#include "transport/ZELServerResponse.h"
#include "transport/ZELServerTCPIPRequest.h"
#include "transport/command.h"
#include "transport/frame_reader.h"
#include "transport/wire_format.h"

namespace zel {

namespace {

constexpr std::string_view kInvalidArguments = "Invalid arguments to method.";
constexpr std::string_view kUnknownRequestType = "Unknown request type";
constexpr std::string_view kInvalidDirection = "Invalid transfer direction";
constexpr const char* kResultPortName = "requesterResultPort";

// Room for a host name of up to 295 characters and its terminator.
constexpr std::size_t kHostNameCapacity = 296;

// Big enough for any dotted IPv4 address with its terminator.
constexpr std::int32_t kAddressBufferSize = 50;

using RequestOwner = std::unique_ptr<IZELServerRequest>;
using ResponseOwner = std::unique_ptr<IZELServerResponse>;

IZELServerStatus* channelError(std::string_view text) { return makeStatus(msg::kServerError, std::string(text)); }

// Socket failures carry the socket code as their secondary code too, so a client can tell a time-out
// or a refused connection from other failures without reading the text.
IZELServerStatus* sendFailed(std::int32_t code)
{
    return makeStatusWithCode(static_cast<unsigned>(code), msg::kSendFailed, decimalText(code));
}

IZELServerStatus* receiveFailed(std::int32_t code)
{
    return makeStatusWithCode(static_cast<unsigned>(code), msg::kReceiveFailed, decimalText(code));
}

// The steps whose message takes no parameter carry the socket code only as the secondary code.
IZELServerStatus* socketFailure(unsigned number, std::int32_t code)
{
    return makeStatusWithCode(static_cast<unsigned>(code), number);
}

IZELServerStatus* frameTooLarge(const wire::FrameReader& reader)
{
    return makeStatus(msg::kUnexpectedReply, "a frame of " + decimalText(reader.announced()) +
                                                 " bytes, more than the " + decimalText(reader.limit()) +
                                                 " bytes that MAX_REPLY_BYTES allows");
}

IZELServerStatus* serverErrorStatus(std::string_view body)
{
    const wire::ServerError error = wire::classifyServerError(body);
    return makeStatusWithCode(static_cast<unsigned>(error.kind), msg::kServerError, error.message);
}

IZELServerStatus* classifyReply(const std::string& reply, IZELServerResponse& response)
{
    const std::optional<wire::Reply> parts = wire::splitReply(reply);
    if (!parts) {
        return makeStatus(msg::kReplyWithoutBody, reply);
    }
    if (parts->status == wire::kSuccess) {
        response.setBody(parts->body);
        return nullptr;
    }
    if (parts->status == wire::kError) {
        response.setBody(parts->body);
        return serverErrorStatus(parts->body);
    }
    return makeStatus(msg::kUnexpectedReply, reply);
}

// Socket failures that leave a listener unable to take the server's call. A refused SO_REUSEADDR
// does not: the bind that follows decides.
bool listenerUnusable(std::int32_t errorCode) { return errorCode != 0 && errorCode != SOCK_REUSE_FAILED; }

bool peerIsTrusted(std::string_view trustedHostNames, const char* peerAddress)
{
    if (peerAddress == nullptr) {
        return false;
    }
    ZELServerStringArray names;
    names.appendTokensAnyOf(std::string(trustedHostNames).c_str(), " \t");
    for (const std::string& listed : names.items()) {
        // The server calls back on the address that "requesterHost" names, this machine's own, so a
        // server on this machine arrives from that address and never from the loopback one.
        const std::string name = listed == "localhost" ? platform::localHostName(kHostNameCapacity) : listed;
        if (name.empty()) {
            continue;
        }
        for (const platform::Ipv4Address address : platform::resolveIPv4(name.c_str())) {
            if (platform::dottedAddress(address) == peerAddress) {
                return true;
            }
        }
    }
    return false;
}

std::optional<std::string> propertyOf(const IZELServerConnectionInfo& info, const char* key)
{
    ZELServerString value;
    if (!info.getProperty(ZELServerString(key), value)) {
        return std::nullopt;
    }
    return value.str();
}

}  // namespace

// Everything one exchange needs about its file, and the one chunk buffer both directions share.
struct ZELServerTCPIPChannel::Transfer {
    LocalFile* upload = nullptr;
    LocalFile* download = nullptr;
    IZELServerProgressListener* progress = nullptr;
    wire::FileHeader uploadHeader;
    std::unique_ptr<char[]> chunk;
    bool localWriteFailed = false;

    void reportTotal(std::uint32_t bytes) const
    {
        if (progress != nullptr) {
            progress->totalSize(bytes);
            progress->start();
        }
    }
    void reportPosition(std::uint32_t bytes) const
    {
        if (progress != nullptr) {
            progress->position(bytes);
        }
    }
    void reportFinish() const
    {
        if (progress != nullptr) {
            progress->finish();
        }
    }
};

ZELServerTCPIPChannel::ZELServerTCPIPChannel() = default;

// ---- Frames on a socket ---------------------------------------------------------------------------

// A time-out or a refused frame leaves the server in the middle of a message; what it sends later
// would be read as the answer to the next command, so the connection is given up (the next open
// connects afresh).
void ZELServerTCPIPChannel::dropIfOutOfStep(TcpSocket& socket, bool outOfStep)
{
    if (outOfStep && &socket == socket_.get()) {
        socket_.reset();
    }
}

IZELServerStatus* ZELServerTCPIPChannel::sendBytes(TcpSocket& socket, std::string_view bytes)
{
    const std::int32_t code = socket.sendBuffer(bytes.data(), bytes.size());
    if (code == 0) {
        return nullptr;
    }
    IZELServerStatus* status = sendFailed(code);
    dropIfOutOfStep(socket, code == SOCK_TIMED_OUT);
    return status;
}

IZELServerStatus* ZELServerTCPIPChannel::sendFrame(TcpSocket& socket, std::string_view payload)
{
    const std::optional<std::string> frame = wire::encodeFrame(payload);
    return frame ? sendBytes(socket, *frame) : sendFailed(SOCK_SEND_FAILED);
}

IZELServerStatus* ZELServerTCPIPChannel::receiveBytes(TcpSocket& socket, char* buffer, std::size_t count)
{
    const std::int32_t code = socket.receiveExact(buffer, static_cast<std::int32_t>(count));
    if (code == 0) {
        return nullptr;
    }
    IZELServerStatus* status = receiveFailed(code);
    dropIfOutOfStep(socket, code == SOCK_TIMED_OUT);
    return status;
}

IZELServerStatus* ZELServerTCPIPChannel::receiveFrame(TcpSocket& socket, std::string& payload)
{
    wire::FrameReader reader(limits_.maxReplyBytes);
    while (const std::size_t wanted = reader.wanted()) {
        if (IZELServerStatus* status = receiveBytes(socket, reader.space(), wanted)) {
            return status;
        }
        reader.commit(wanted);
    }
    if (reader.state() == wire::FrameReader::State::TooLarge) {
        IZELServerStatus* status = frameTooLarge(reader);
        dropIfOutOfStep(socket, true);
        return status;
    }
    payload = reader.takePayload();
    return nullptr;
}

// The acknowledgement the server gives before a file header and before file content.
IZELServerStatus* ZELServerTCPIPChannel::receiveAcknowledgement(TcpSocket& socket)
{
    std::string payload;
    if (IZELServerStatus* status = receiveFrame(socket, payload)) {
        return status;
    }
    const wire::AckReading ack = wire::readAcknowledgement(payload);
    switch (ack.outcome) {
    case wire::AckOutcome::Ready:
        return nullptr;
    case wire::AckOutcome::NotTwoParts:
        return makeStatus(msg::kReplyWithoutBody, payload);
    case wire::AckOutcome::Refused:
        break;
    }
    return serverErrorStatus(ack.body);
}

ZELServerTCPIPChannel::~ZELServerTCPIPChannel()
{
    socket_.reset();
    identity_.reset();
}

// ---- Connection and sign-in -----------------------------------------------------------------------

IZELServerStatus* ZELServerTCPIPChannel::open(const IZELServerConnectionInfo& info,
                                              const IZELServerStringArray* options)
{
    ConnectionLimits limits;
    if (IZELServerStatus* status = readConnectionLimits(info, limits)) {
        return status;
    }
    limits_ = limits;
    takeProperties(info);
    if (options != nullptr && options->entries() > 1) {
        takeOptions(*options);
    }
    ZELServerString host;
    info.getHost(host);
    host_ = host.str();
    port_ = info.getPort();
    if (IZELServerStatus* status = connect()) {
        return status;
    }
    return signIn(info);
}

// The connection information may carry the same two settings as properties; options given to open
// take precedence over them.
void ZELServerTCPIPChannel::takeProperties(const IZELServerConnectionInfo& info)
{
    ZELServerString value;
    if (info.getProperty(ZELServerString("CLIENT_ID"), value)) {
        clientId_ = value.str();
    }
    if (info.getProperty(ZELServerString("TRUSTED_HOST_NAMES"), value)) {
        trustedHostNames_ = value.str();
    }
}

void ZELServerTCPIPChannel::takeOptions(const IZELServerStringArray& options)
{
    for (unsigned i = 1; i < options.entries(); i += 2) {
        const std::string_view key = options.element(i - 1);
        if (key == "CLIENT_ID") {
            clientId_ = options.element(i);
        } else if (key == "TRUSTED_HOST_NAMES") {
            trustedHostNames_ = options.element(i);
        }
    }
}

IZELServerStatus* ZELServerTCPIPChannel::connect()
{
    // A live connection is kept: the server ties the session's state to this one TCP connection.
    if (socket_ && !socket_->probeConnection()) {
        socket_.reset();
    }
    if (!socket_) {
        socket_.reset(new (std::nothrow) TcpSocket(host_.c_str(), port_, limits_.connectTimeoutMs));
    }
    if (!socket_) {
        return makeStatus(msg::kConnectFailed);
    }
    // A failed socket stays in place; the next open probes it, finds it unusable and replaces it.
    if (socket_->errorCode != 0) {
        return socketFailure(msg::kConnectFailed, socket_->errorCode);
    }
    socket_->setIoTimeout(limits_.ioTimeoutMs);
    return nullptr;
}

IZELServerStatus* ZELServerTCPIPChannel::signIn(const IZELServerConnectionInfo& info)
{
    const RequestOwner request(createRequest("SERVER_SESSION_INIT"));
    const ResponseOwner response(createResponse());
    if (!request || !response) {
        return makeStatus(msg::kSignInRefused);
    }
    switch (info.getAuthenticationKind()) {
    case kTokenAuthentication:
        // A token sign-in is configured through the "USER_TOKEN" connection property.
        request->addValue("userToken", propertyOf(info, "USER_TOKEN").value_or(std::string()));
        break;
    case kSingleSignOnAuthentication:
        if (const std::optional<std::string> data = propertyOf(info, "SSO_AUTH_DATA")) {
            request->addValue("ssoAuthData", *data);
        }
        break;
    default: {
        ZELServerString user;
        ZELServerString password;
        info.getUserName(user);
        info.getPassword(password);
        request->addValue("userID", user);
        request->addValue("userPassword", password);
        break;
    }
    }
    // The request has taken its copy of the identity (none on the first sign-in). From here on the
    // channel holds one, empty and unauthenticated until a reply says otherwise, so that callers can
    // ask it whether they are signed in, also after a refusal.
    ensureIdentity();
    if (IZELServerStatus* status = sendRequest(*request, *response, kPlainRequest)) {
        return status;
    }
    // The reply may replace the identity by a single sign-on one, or take it away altogether.
    IZELServerIdentity* identity = identity_.release();
    ZELServerStringDict settings;
    const int read = response->readSessionInit(identity, settings);
    identity_.reset(identity);
    ensureIdentity();
    if (read != 0 || !identity_ || !identity_->isAuthenticated()) {
        return makeStatus(msg::kSignInRefused);
    }
    return nullptr;
}

void ZELServerTCPIPChannel::ensureIdentity()
{
    if (!identity_) {
        identity_.reset(new ZELServerIdentity());
    }
}

IZELServerStatus* ZELServerTCPIPChannel::close()
{
    if (!socket_) {
        return makeStatus(msg::kNotConnected);
    }
    socket_.reset();
    return nullptr;
}

// ---- Requests and responses -----------------------------------------------------------------------

IZELServerRequest* ZELServerTCPIPChannel::createRequest(const std::string& keyword,
                                                        const IZELServerStringArray& directives,
                                                        const IZELServerStringArray& notifications)
{
    IZELServerRequest* request = createRequest(keyword);
    if (request != nullptr) {
        request->appendDirectives(directives);
        request->appendNotifications(notifications);
    }
    return request;
}

IZELServerRequest* ZELServerTCPIPChannel::createRequest(const std::string& keyword)
{
    // The channel's identity is always the library's own (plain or single sign-on).
    return new ZELServerTCPIPRequest(keyword, dynamic_cast<const ZELServerIdentity*>(identity_.get()), clientId_);
}

IZELServerResponse* ZELServerTCPIPChannel::createResponse() { return new ZELServerResponse(this); }

void ZELServerTCPIPChannel::destroyRequest(IZELServerRequest* request) { delete request; }

void ZELServerTCPIPChannel::destroyResponse(IZELServerResponse* response) { delete response; }

IZELServerIdentity* ZELServerTCPIPChannel::getIdentity() { return identity_.get(); }

// ---- Commands -------------------------------------------------------------------------------------

IZELServerStatus* ZELServerTCPIPChannel::transferFile(IZELServerRequest& request, IZELServerResponse& response,
                                                      const std::string& localPath, unsigned direction,
                                                      IZELServerProgressListener* progress)
{
    if (direction == kUpload) {
        LocalFile file(localPath);
        if (!file.isOpen()) {
            return makeStatus(msg::kLocalFileRead, localPath);
        }
        return exchange(request, response, &file, nullptr, progress);
    }
    if (direction == kDownload) {
        // The one download path; the channel does not read the final answer, so a file that came
        // complete replaces the destination whatever the server said after it.
        std::optional<TemporaryFile> temporary;
        std::uint64_t arrived = kNoFileArrived;
        if (IZELServerStatus* status =
                receiveIntoTemporary(*this, request, response, localPath, progress, temporary, arrived)) {
            return status;
        }
        if (arrived != kNoFileArrived && !temporary->moveTo(localPath)) {
            return makeStatus(msg::kLocalFileWrite, localPath);
        }
        return nullptr;
    }
    return channelError(kInvalidDirection);
}

IZELServerStatus* ZELServerTCPIPChannel::sendRequest(IZELServerRequest& request, IZELServerResponse& response,
                                                     unsigned requestType)
{
    switch (requestType) {
    case kPlainRequest:
    case kPlainRequestAlias:
        return exchange(request, response, nullptr, nullptr, nullptr);
    case kResultPortRequest:
        return resultPortExchange(request, response);
    default:
        return channelError(kUnknownRequestType);
    }
}

IZELServerStatus* ZELServerTCPIPChannel::exchange(IZELServerRequest& request, IZELServerResponse& response,
                                                  LocalFile* upload, LocalFile* download,
                                                  IZELServerProgressListener* progress)
{
    if (upload != nullptr && download != nullptr) {
        return channelError(kInvalidArguments);
    }
    if (download != nullptr && !download->isOpen()) {
        return makeStatus(msg::kLocalFileWrite, download->path());
    }
    if (!socket_) {
        return makeStatus(msg::kNotConnected);
    }
    // The text goes into the frame with one copy; only text that is not UTF-8 is converted first.
    std::string_view text = request.textView();
    std::string converted;
    if (!isValidUtf8(text)) {
        converted = latin1ToUtf8(text);
        text = converted;
    }
    Transfer transfer;
    transfer.upload = upload;
    transfer.download = download;
    transfer.progress = progress;
    if (upload != nullptr) {
        // Length and checksum are settled before the command goes out, so that a file that cannot be
        // read, or is too long for the 32-bit header, is refused while the connection is in step.
        const std::optional<std::uint64_t> size = upload->size();
        const std::optional<std::uint32_t> crc =
            size && *size <= std::numeric_limits<std::uint32_t>::max() ? upload->crc32() : std::nullopt;
        if (!crc) {
            return makeStatus(msg::kLocalFileRead, upload->path());
        }
        transfer.uploadHeader = wire::FileHeader{static_cast<std::uint32_t>(*size), *crc};
    }
    std::string reply;
    if (IZELServerStatus* status = sendAndReceive(text, transfer, reply)) {
        return status;
    }
    if (transfer.localWriteFailed) {
        return makeStatus(msg::kLocalFileWrite, download->path());
    }
    return classifyReply(reply, response);
}

IZELServerStatus* ZELServerTCPIPChannel::sendAndReceive(std::string_view requestText, Transfer& transfer,
                                                        std::string& reply)
{
    const std::optional<std::string> frame = wire::encodeCommandFrame(requestText);
    if (!frame) {
        return sendFailed(SOCK_SEND_FAILED);
    }
    // The buffer comes before the command goes out: without it the file could not be moved, and the
    // server would already be sending it.
    if (transfer.upload != nullptr || transfer.download != nullptr) {
        transfer.chunk.reset(new (std::nothrow) char[wire::kChunkSize]);
        if (!transfer.chunk) {
            return transfer.upload != nullptr ? makeStatus(msg::kLocalFileRead, transfer.upload->path())
                                              : makeStatus(msg::kLocalFileWrite, transfer.download->path());
        }
    }
    if (IZELServerStatus* status = sendBytes(*socket_, *frame)) {
        return status;
    }
    // The server is answering from here on: an exception (memory exhausted) that ends the exchange
    // before the whole answer is read leaves the connection out of step, so it is given up.
    try {
        return receiveAnswer(transfer, reply);
    } catch (...) {
        socket_.reset();
        throw;
    }
}

IZELServerStatus* ZELServerTCPIPChannel::receiveAnswer(Transfer& transfer, std::string& reply)
{
    if (transfer.upload != nullptr) {
        if (IZELServerStatus* status = uploadFile(transfer)) {
            return status;
        }
    }
    if (transfer.download != nullptr) {
        bool noFile = false;
        if (IZELServerStatus* status = downloadFile(transfer, noFile)) {
            return status;
        }
        if (noFile) {
            // The server answers a download it has nothing for with a frame that is no file header
            // and sends nothing after it; reading on would wait for ever.
            reply = wire::noFileReply();
            return nullptr;
        }
    }
    return socket_ ? receiveFrame(*socket_, reply) : makeStatus(msg::kNotConnected);
}

IZELServerStatus* ZELServerTCPIPChannel::uploadFile(Transfer& transfer)
{
    TcpSocket& socket = *socket_;
    LocalFile& file = *transfer.upload;
    if (IZELServerStatus* status = receiveAcknowledgement(socket)) {
        return status;
    }
    if (IZELServerStatus* status = sendFrame(socket, wire::encodeFileHeader(transfer.uploadHeader))) {
        return status;
    }
    if (IZELServerStatus* status = receiveAcknowledgement(socket)) {
        return status;
    }
    if (!file.rewind()) {
        return makeStatus(msg::kLocalFileRead, file.path());
    }
    const std::uint32_t total = transfer.uploadHeader.length;
    transfer.reportTotal(total);
    // Exactly the announced length goes out: a file that shrank since is a read error, and bytes
    // that grew onto it would be taken by the server as the start of the next message.
    for (std::uint32_t sent = 0; sent < total;) {
        transfer.reportPosition(sent);
        const std::size_t wanted = std::min<std::size_t>(total - sent, wire::kChunkSize);
        const std::optional<std::size_t> got = file.read(transfer.chunk.get(), wanted);
        if (!got || *got != wanted) {
            return makeStatus(msg::kLocalFileRead, file.path());
        }
        if (IZELServerStatus* status = sendBytes(socket, std::string_view(transfer.chunk.get(), wanted))) {
            return status;
        }
        sent += static_cast<std::uint32_t>(wanted);
    }
    transfer.reportFinish();
    return nullptr;
}

IZELServerStatus* ZELServerTCPIPChannel::downloadFile(Transfer& transfer, bool& noFile)
{
    TcpSocket& socket = *socket_;
    LocalFile& file = *transfer.download;
    std::string payload;
    if (IZELServerStatus* status = receiveFrame(socket, payload)) {
        return status;
    }
    const wire::FileHeaderReading header = wire::parseFileHeader(payload);
    if (header.outcome == wire::HeaderParse::NotTwoParts) {
        return makeStatus(msg::kReplyWithoutBody, payload);
    }
    if (header.outcome == wire::HeaderParse::Unusable) {
        // A refusal comes as an "ERROR" reply in place of the header: the server's own words.
        const std::optional<wire::Reply> refusal = wire::splitReply(payload);
        if (refusal && refusal->status == wire::kError) {
            return serverErrorStatus(refusal->body);
        }
        noFile = true;
        return nullptr;
    }
    if (IZELServerStatus* status = sendFrame(socket, wire::acknowledgement())) {
        return status;
    }
    // Deliberately asymmetric with the upload: the announced checksum is read but not compared
    // with the content.
    const std::uint32_t total = header.header.length;
    transfer.reportTotal(total);
    for (std::uint32_t received = 0; received < total;) {
        transfer.reportPosition(received);
        const std::size_t piece = std::min<std::size_t>(total - received, wire::kChunkSize);
        if (IZELServerStatus* status = receiveBytes(socket, transfer.chunk.get(), piece)) {
            return status;
        }
        // After a failed write the content is still read to its end, so the connection stays in
        // step for the reply and for the next command; the failure is reported once it is over.
        if (!transfer.localWriteFailed && !file.write(transfer.chunk.get(), piece)) {
            transfer.localWriteFailed = true;
        }
        received += static_cast<std::uint32_t>(piece);
    }
    if (!file.close()) {
        transfer.localWriteFailed = true;
    }
    transfer.reportFinish();
    return sendFrame(socket, wire::acknowledgement());
}

// ---- Result port ----------------------------------------------------------------------------------

IZELServerStatus* ZELServerTCPIPChannel::resultPortExchange(IZELServerRequest& request, IZELServerResponse& response)
{
    ZELServerStringArray directives;
    ZELServerStringArray notifications;
    request.getDirectives(directives);
    request.getNotifications(notifications);

    std::uint16_t port = 0;
    const ZELServerStringDict directiveDict = toStringDict(directives);
    if (const std::string* wanted = directiveDict.find(kResultPortName); wanted != nullptr && !wanted->empty()) {
        const std::optional<std::uint32_t> number = toUInt32AnyBase(*wanted);
        if (!number || *number > std::numeric_limits<std::uint16_t>::max()) {
            return makeStatus(msg::kInvalidArgument, std::vector<std::string>{kResultPortName, *wanted});
        }
        port = static_cast<std::uint16_t>(*number);
    }
    const std::unique_ptr<TcpSocket> listener(new (std::nothrow) TcpSocket(port));
    if (!listener || listenerUnusable(listener->errorCode)) {
        return makeStatus(msg::kResultPortAcceptFailed);
    }
    char address[kAddressBufferSize] = {};
    listener->localHostAddress(address, kAddressBufferSize);

    // The directives go out unchanged behind the bound port, so a caller's own "requesterResultPort"
    // appears twice on the wire, the bound one first. Servers are written against exactly this
    // request, so it is not tidied up.
    request.addValue(kResultPortName, decimalText(port));
    request.addValue("requesterHost", std::string(address));
    request.addValueList("directives", directives);
    for (unsigned i = 1; i < notifications.entries(); i += 2) {
        request.addValue("notificationMsg", std::string(notifications.element(i - 1)) + ":" + notifications.element(i));
    }

    if (IZELServerStatus* status = exchange(request, response, nullptr, nullptr, nullptr)) {
        return status;
    }
    if (const std::int32_t code = listener->acceptPeer(limits_.resultPortTimeoutMs)) {
        return socketFailure(msg::kResultPortAcceptFailed, code);
    }
    listener->setIoTimeout(limits_.ioTimeoutMs);
    if (!trustedHostNames_.empty()) {
        while (!peerIsTrusted(trustedHostNames_, listener->getPeerAddress())) {
            if (const std::int32_t code = listener->acceptPeer(limits_.resultPortTimeoutMs)) {
                return socketFailure(msg::kResultPortAcceptFailed, code);
            }
        }
    }
    std::string result;
    if (IZELServerStatus* status = receiveFrame(*listener, result)) {
        return status;
    }
    // The result frame is the whole answer: it carries no status word to split off.
    response.setBody(result);
    listener->close();
    return nullptr;
}

}  // namespace zel
