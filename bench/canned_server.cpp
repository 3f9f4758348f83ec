#include "canned_server.h"

#include <netinet/in.h>
#include <signal.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <map>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>

#include <zlib.h>

#include "wire.h"

namespace bench {
namespace {

std::string reply(std::string_view status, std::string_view body)
{
    std::string out(status);
    out += '\0';
    out += body;
    return out;
}

class Connection {
public:
    Connection(int fd, const CannedServerConfig& config, const std::string& listBody)
        : fd_(fd), config_(config), listBody_(listBody)
    {}

    void serve()
    {
        const std::map<std::string, std::pair<std::string, std::function<bool()>>> canned = {
            {"SERVER_SESSION_INIT", {signInRequest(), [this] { return answer(signInReply()); }}},
            {"REP_REPOSITORYEXISTS", {repositoryExistsRequest(), [this] { return answer("true"); }}},
            {"SR_GET_SHAREDRESOURCE", {sharedResourceRequest(), [this] { return answer(resourceReply()); }}},
            {"SR_UPLOAD", {uploadRequest(), [this] { return takeUpload(); }}},
            {"SR_DOWNLOAD", {downloadRequest(), [this] { return giveDownload(); }}},
            {"SR_LIST", {listRequest(), [this] { return answer(listBody_); }}},
        };
        const std::string header = commandPayload("");
        std::string payload;
        while (receiveFrame(fd_, payload)) {
            const std::string text =
                payload.compare(0, header.size(), header) == 0 ? payload.substr(header.size()) : "";
            const auto found = canned.find(text.substr(0, text.find('\0')));
            bool going = false;
            if (found == canned.end() || found->second.first != text) {
                std::string shown = text;
                std::replace(shown.begin(), shown.end(), '\0', '|');
                going = sendFrame(fd_, reply("ERROR", "the request differs from the canned one: " + shown));
            } else {
                going = found->second.second();
            }
            if (!going) {
                break;
            }
        }
        ::close(fd_);
    }

private:
    static std::string signInReply()
    {
        return std::string(
                   "<SERVER_SESSION_INIT security_enabled=\"true\" security_pubparm=\"false\"><IDENTITY id=\"") +
               kUser +
               "\" is_authenticated=\"true\"><ROLES><ROLE name=\"user\"/></ROLES></IDENTITY></SERVER_SESSION_INIT>";
    }

    static std::string resourceReply()
    {
        return std::string("<SR_GET_SHAREDRESOURCE><SHAREDRESOURCE name=\"") + kResource +
               "\" displayname=\"Bench\" description=\"canned\"/></SR_GET_SHAREDRESOURCE>";
    }

    bool answer(std::string_view body) { return sendFrame(fd_, reply("SUCCESS", body)); }

    bool takeUpload()
    {
        std::string frame;
        std::uint64_t length = 0;
        std::uint32_t announced = 0;
        if (!sendFrame(fd_, acknowledgement()) || !receiveFrame(fd_, frame) ||
            !parseFileHeader(frame, length, announced) || !sendFrame(fd_, acknowledgement())) {
            return false;
        }
        const std::unique_ptr<char[]> buffer(new char[kChunk]);
        uLong crc = crc32(0L, Z_NULL, 0);
        for (std::uint64_t done = 0; done < length;) {
            const std::size_t piece = static_cast<std::size_t>(std::min<std::uint64_t>(length - done, kChunk));
            if (!receiveAll(fd_, buffer.get(), piece)) {
                return false;
            }
            crc = crc32(crc, reinterpret_cast<const Bytef*>(buffer.get()), static_cast<uInt>(piece));
            done += piece;
        }
        if (crc != announced) {
            return sendFrame(fd_, reply("ERROR", "CRC mismatch"));
        }
        return answer("true");
    }

    bool giveDownload()
    {
        const std::uint64_t length = config_.downloadBytes;
        std::string ack;
        if (!sendFrame(fd_, fileHeader(length, contentCrc(length))) || !receiveFrame(fd_, ack) ||
            ack != acknowledgement()) {
            return false;
        }
        const std::string& pattern = contentPattern();
        for (std::uint64_t done = 0; done < length;) {
            const std::size_t piece = static_cast<std::size_t>(std::min<std::uint64_t>(length - done, pattern.size()));
            if (!sendAll(fd_, pattern.data(), piece)) {
                return false;
            }
            done += piece;
        }
        return receiveFrame(fd_, ack) && ack == acknowledgement() && answer("true");
    }

    int fd_;
    const CannedServerConfig& config_;
    const std::string& listBody_;
};

[[noreturn]] void serveForever(int listener, const CannedServerConfig& config)
{
    const std::string listBody = listReplyBody(config.listEntries);
    contentCrc(config.downloadBytes);  // warms the pattern before the first client waits on it
    for (;;) {
        const int fd = ::accept(listener, nullptr, nullptr);
        if (fd < 0) {
            continue;
        }
        std::thread([fd, &config, &listBody] { Connection(fd, config, listBody).serve(); }).detach();
    }
}

}  // namespace

CannedServer::CannedServer(const CannedServerConfig& config)
{
    const int listener = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof address;
    if (listener < 0 || ::bind(listener, reinterpret_cast<sockaddr*>(&address), size) != 0 ||
        ::listen(listener, 16) != 0 || ::getsockname(listener, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
        throw std::runtime_error("the canned server cannot listen on 127.0.0.1");
    }
    port_ = ntohs(address.sin_port);
    std::fflush(nullptr);
    child_ = ::fork();
    if (child_ < 0) {
        throw std::runtime_error("the canned server cannot be started");
    }
    if (child_ == 0) {
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        serveForever(listener, config);
    }
    ::close(listener);
}

CannedServer::~CannedServer()
{
    if (child_ > 0) {
        ::kill(child_, SIGKILL);
        ::waitpid(child_, nullptr, 0);
    }
}

}  // namespace bench
