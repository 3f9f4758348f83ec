#include "test_client.h"

#include <fcntl.h>

#include <cerrno>
#include <chrono>

namespace zeltest {

using namespace std::string_literals;

std::string requestPayload(const std::string& keyword, Values values)
{
    values.insert(values.begin(), {"clientID", ""});
    return request(keyword, values);
}

WireReply splitReply(const std::string& payload)
{
    std::size_t nul = payload.find('\0');
    if (nul == std::string::npos)
        return {payload, {}};
    return {payload.substr(0, nul), payload.substr(nul + 1)};
}

std::string pathDocument(const std::string& path)
{
    return "<?xml version=\"1.0\"?><SR_PATH><PATH abspath=\"" + path + "\"/></SR_PATH>";
}

bool TestClient::connect(std::uint16_t port)
{
    socket_ = openTcpSocket();
    // Jobs of the server in this process must not inherit the test's end of a connection.
    return socket_.valid() && ::fcntl(socket_.get(), F_SETFD, FD_CLOEXEC) == 0 && connectTo(socket_, kLoopback, port);
}

bool TestClient::sendRaw(const std::string& bytes)
{
    for (std::size_t sent = 0; sent < bytes.size();) {
        const long n = sendSome(socket_, bytes.data() + sent, bytes.size() - sent);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        sent += static_cast<std::size_t>(n);
    }
    return true;
}

bool TestClient::recvExact(char* data, std::size_t size, int timeoutMs)
{
    while (size > 0) {
        if (!waitReadable(socket_, std::chrono::milliseconds(timeoutMs)))
            return false;
        const long n = receiveSome(socket_, data, size);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        data += n;
        size -= static_cast<std::size_t>(n);
    }
    return true;
}

std::optional<std::string> TestClient::readFrame(int timeoutMs)
{
    unsigned char prefix[4];
    if (!socket_.valid() || !recvExact(reinterpret_cast<char*>(prefix), 4, timeoutMs))
        return std::nullopt;
    std::uint32_t n = (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) |
                      (std::uint32_t{prefix[2]} << 8) | prefix[3];
    if (n > (64u << 20))
        return std::nullopt;
    std::string payload(n, '\0');
    if (n > 0 && !recvExact(payload.data(), n, timeoutMs))
        return std::nullopt;
    return payload;
}

bool TestClient::closedByPeer(int timeoutMs)
{
    // A server that closes with request bytes still unread makes the kernel reset the
    // connection instead of ending it; both mean the server closed it.
    if (!waitReadable(socket_, std::chrono::milliseconds(timeoutMs)))
        return false;
    char byte;
    const long n = receiveSome(socket_, &byte, 1);
    return n == 0 || (n < 0 && errno == ECONNRESET);
}

WireReply TestClient::command(const std::string& keyword, const Values& values)
{
    return sendFrame(requestPayload(keyword, values)) ? readReply() : WireReply{};
}

WireReply TestClient::signIn(const std::string& user, const std::string& password)
{
    return command("SERVER_SESSION_INIT", {{"userID", user}, {"userPassword", password}});
}

WireReply TestClient::startUpload(const std::string& keyword, const Values& values, const std::string& header)
{
    WireReply reply = command(keyword, values);
    if (!reply.ok() || reply.body != "ready_to_transfer")
        return reply;
    return sendFrame(header) ? readReply() : WireReply{};
}

WireReply TestClient::upload(const std::string& keyword, const Values& values, const std::string& content,
                             std::optional<std::uint32_t> announcedCrc)
{
    WireReply reply = startUpload(keyword, values, fileHeader(content.size(), announcedCrc.value_or(crc32(content))));
    if (!reply.ok() || reply.body != "ready_to_transfer")
        return reply;
    return sendRaw(content) ? readReply() : WireReply{};
}

Download TestClient::download(const std::string& keyword, const Values& values)
{
    Download result;
    result.reply = command(keyword, values);
    const WireReply header = result.reply;
    if (header.status.rfind("fileLength=", 0) != 0 || header.body.rfind("fileCRC=", 0) != 0)
        return result;
    result.reply = {};
    std::size_t length = std::stoul(header.status.substr(11));
    if (!sendFrame(readyAck()))
        return result;
    result.content.assign(length, '\0');
    if (length > 0 && !recvExact(result.content.data(), length, 5000))
        return result;
    result.gotFile = crc32(result.content) == std::stoul(header.body.substr(8));
    if (sendFrame(readyAck()))
        result.reply = readReply();
    return result;
}

}  // namespace zeltest
