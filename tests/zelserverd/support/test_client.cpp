#include "test_client.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>

namespace zeltest {

using namespace std::string_literals;

std::string requestPayload(const std::string& keyword, const Values& values)
{
    std::string payload = "APIVERSION=1\0"s + keyword + "\0clientID=";
    for (const auto& [name, value] : values)
        payload += "\0"s + name + "=" + value;
    return payload;
}

std::string frame(const std::string& payload)
{
    std::string prefix(4, '\0');
    for (int i = 0; i < 4; ++i)
        prefix[i] = static_cast<char>(payload.size() >> (24 - 8 * i));
    return prefix + payload;
}

WireReply splitReply(const std::string& payload)
{
    std::size_t nul = payload.find('\0');
    if (nul == std::string::npos)
        return {payload, {}};
    return {payload.substr(0, nul), payload.substr(nul + 1)};
}

std::uint32_t crc32(const std::string& data)
{
    std::uint32_t c = 0xFFFFFFFFu;
    for (unsigned char byte : data) {
        c ^= byte;
        for (int k = 0; k < 8; ++k)
            c = (c & 1) ? 0xEDB88320u ^ (c >> 1) : c >> 1;
    }
    return ~c;
}

std::string pathDocument(const std::string& path)
{
    return "<?xml version=\"1.0\"?><SR_PATH><PATH abspath=\"" + path + "\"/></SR_PATH>";
}

TestClient::~TestClient() { close(); }

bool TestClient::connect(std::uint16_t port)
{
    close();
    fd_ = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in addr{};
    addr.sin_family = AF_INET;
    addr.sin_port = htons(port);
    addr.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    return fd_ >= 0 && ::connect(fd_, reinterpret_cast<sockaddr*>(&addr), sizeof addr) == 0;
}

void TestClient::close()
{
    if (fd_ >= 0)
        ::close(fd_);
    fd_ = -1;
}

bool TestClient::sendRaw(const std::string& bytes)
{
    std::size_t sent = 0;
    while (sent < bytes.size()) {
        ssize_t n = ::send(fd_, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            return false;
        sent += static_cast<std::size_t>(n);
    }
    return true;
}

bool TestClient::waitReadable(int timeoutMs)
{
    pollfd p{fd_, POLLIN, 0};
    return ::poll(&p, 1, timeoutMs) == 1;
}

bool TestClient::recvExact(char* data, std::size_t size, int timeoutMs)
{
    while (size > 0) {
        if (!waitReadable(timeoutMs))
            return false;
        ssize_t n = ::recv(fd_, data, size, 0);
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
    if (fd_ < 0 || !recvExact(reinterpret_cast<char*>(prefix), 4, timeoutMs))
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
    if (!waitReadable(timeoutMs))
        return false;
    // A server that closes with request bytes still unread makes the kernel reset the
    // connection instead of ending it; both mean the server closed it.
    char byte;
    ssize_t n = ::recv(fd_, &byte, 1, 0);
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
    const std::string crc = std::to_string(announcedCrc.value_or(crc32(content)));
    WireReply reply =
        startUpload(keyword, values, "fileLength=" + std::to_string(content.size()) + "\0fileCRC="s + crc);
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
    const std::string ack = "SUCCESS\0ready_to_transfer"s;
    if (!sendFrame(ack))
        return result;
    result.content.assign(length, '\0');
    if (length > 0 && !recvExact(result.content.data(), length, 5000))
        return result;
    result.gotFile = crc32(result.content) == std::stoul(header.body.substr(8));
    if (sendFrame(ack))
        result.reply = readReply();
    return result;
}

}  // namespace zeltest
