#include "wire.h"

#include <fcntl.h>
#include <sys/socket.h>
#include <unistd.h>

#include <cerrno>
#include <algorithm>
#include <cstdio>
#include <memory>

#include <zlib.h>

namespace bench {
namespace {

constexpr std::string_view kDeclaration = "<?xml version=\"1.0\" encoding=\"UTF-8\" standalone=\"no\" ?>";
constexpr std::size_t kPatternSize = 1 << 20;

std::string value(std::string_view name, std::string_view text)
{
    std::string out(1, '\0');
    out += name;
    out += '=';
    out += text;
    return out;
}

// What every command after sign-in starts with: the keyword, the signed-in identity as a document
// rooted at the keyword, and the (empty) client identifier.
std::string signedInRequest(std::string_view keyword)
{
    std::string identity(kDeclaration);
    identity += "<" + std::string(keyword) + "><IDENTITY id=\"" + kUser +
                "\" is_authenticated=\"true\"><ROLES><ROLE name=\"user\"/></ROLES></IDENTITY></" +
                std::string(keyword) + ">";
    return std::string(keyword) + value("identityObject", identity) + value("clientID", "");
}

// A "PATH" document as the library writes it: attributes in name order.
std::string pathDocument(std::string_view keyword, std::string_view path)
{
    const std::size_t slash = path.rfind('/');
    const std::string_view directory = path.substr(0, slash);
    const std::string_view name = path.substr(slash + 1);
    std::string out(kDeclaration);
    out += "<" + std::string(keyword) + "><PATH abspath=\"" + std::string(path) + "\" dirpath=\"" +
           std::string(directory) + "\" name=\"" + std::string(name) + "\"/></" + std::string(keyword) + ">";
    return out;
}

}  // namespace

bool sendAll(int fd, const void* data, std::size_t size)
{
    const auto* bytes = static_cast<const char*>(data);
    while (size > 0) {
        const ssize_t sent = ::send(fd, bytes, size, MSG_NOSIGNAL);
        if (sent < 0 && errno == EINTR) {
            continue;
        }
        if (sent <= 0) {
            return false;
        }
        bytes += sent;
        size -= static_cast<std::size_t>(sent);
    }
    return true;
}

bool receiveAll(int fd, void* data, std::size_t size)
{
    auto* bytes = static_cast<char*>(data);
    while (size > 0) {
        const ssize_t got = ::recv(fd, bytes, size, 0);
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got <= 0) {
            return false;
        }
        bytes += got;
        size -= static_cast<std::size_t>(got);
    }
    return true;
}

bool sendFrame(int fd, std::string_view payload)
{
    const auto n = static_cast<std::uint32_t>(payload.size());
    std::string frame{static_cast<char>(n >> 24), static_cast<char>(n >> 16), static_cast<char>(n >> 8),
                      static_cast<char>(n)};
    frame += payload;
    return sendAll(fd, frame.data(), frame.size());
}

bool receiveFrame(int fd, std::string& payload)
{
    unsigned char prefix[4];
    if (!receiveAll(fd, prefix, sizeof prefix)) {
        return false;
    }
    const std::uint32_t n = (std::uint32_t{prefix[0]} << 24) | (std::uint32_t{prefix[1]} << 16) |
                            (std::uint32_t{prefix[2]} << 8) | prefix[3];
    payload.resize(n);
    return receiveAll(fd, payload.data(), n);
}

std::string commandPayload(std::string_view requestText)
{
    std::string payload("APIVERSION=1", 12);
    payload += '\0';
    payload += requestText;
    return payload;
}

std::string signInRequest()
{
    return "SERVER_SESSION_INIT" + value("clientID", "") + value("userID", kUser) + value("userPassword", kPassword);
}

std::string repositoryExistsRequest()
{
    return signedInRequest("REP_REPOSITORYEXISTS") + value("repositoryName", kRepository);
}

std::string sharedResourceRequest() { return signedInRequest("SR_GET_SHAREDRESOURCE") + value("srName", kResource); }

std::string uploadRequest()
{
    return signedInRequest("SR_UPLOAD") + value("srName", kResource) +
           value("srDestPath", pathDocument("SR_UPLOAD", kUploadPath)) + value("itemFileCRCCheckingEnabled", "true");
}

std::string downloadRequest()
{
    return signedInRequest("SR_DOWNLOAD") + value("srName", kResource) +
           value("srSrcPath", pathDocument("SR_DOWNLOAD", kDownloadPath)) + value("itemFileCRCCheckingEnabled", "true");
}

std::string listRequest()
{
    return signedInRequest("SR_LIST") + value("srName", kResource) +
           value("srPath", pathDocument("SR_LIST", kListPath));
}

std::string acknowledgement() { return std::string("SUCCESS\0ready_to_transfer", 25); }

std::string fileHeader(std::uint64_t length, std::uint32_t crc)
{
    return "fileLength=" + std::to_string(length) + value("fileCRC", std::to_string(crc));
}

bool parseFileHeader(std::string_view payload, std::uint64_t& length, std::uint32_t& crc)
{
    const std::size_t nul = payload.find('\0');
    if (nul == std::string_view::npos || payload.substr(0, 11) != "fileLength=" ||
        payload.substr(nul + 1, 8) != "fileCRC=") {
        return false;
    }
    length = std::stoull(std::string(payload.substr(11, nul - 11)));
    crc = static_cast<std::uint32_t>(std::stoul(std::string(payload.substr(nul + 9))));
    return true;
}

const std::string& contentPattern()
{
    static const std::string pattern = [] {
        std::string bytes(kPatternSize, '\0');
        std::uint32_t state = 0x2545F491u;
        for (char& byte : bytes) {
            state = state * 1664525u + 1013904223u;
            byte = static_cast<char>(state >> 24);
        }
        return bytes;
    }();
    return pattern;
}

std::uint32_t contentCrc(std::uint64_t size)
{
    const std::string& pattern = contentPattern();
    uLong crc = crc32(0L, Z_NULL, 0);
    for (std::uint64_t done = 0; done < size;) {
        const std::size_t piece = static_cast<std::size_t>(std::min<std::uint64_t>(size - done, pattern.size()));
        crc = crc32(crc, reinterpret_cast<const Bytef*>(pattern.data()), static_cast<uInt>(piece));
        done += piece;
    }
    return static_cast<std::uint32_t>(crc);
}

bool writeContentFile(const std::string& path, std::uint64_t size)
{
    const int fd = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC, 0644);
    if (fd < 0) {
        return false;
    }
    const std::string& pattern = contentPattern();
    bool good = true;
    for (std::uint64_t done = 0; good && done < size;) {
        const std::size_t piece = static_cast<std::size_t>(std::min<std::uint64_t>(size - done, pattern.size()));
        good = ::write(fd, pattern.data(), piece) == static_cast<ssize_t>(piece);
        done += piece;
    }
    return ::close(fd) == 0 && good;
}

bool fileCrc(const std::string& path, std::uint32_t& crc, std::uint64_t& length)
{
    const int fd = ::open(path.c_str(), O_RDONLY);
    if (fd < 0) {
        return false;
    }
    const std::unique_ptr<char[]> block(new char[kPatternSize]);
    uLong sum = crc32(0L, Z_NULL, 0);
    length = 0;
    ssize_t got = 0;
    while ((got = ::read(fd, block.get(), kPatternSize)) > 0) {
        sum = crc32(sum, reinterpret_cast<const Bytef*>(block.get()), static_cast<uInt>(got));
        length += static_cast<std::uint64_t>(got);
    }
    ::close(fd);
    crc = static_cast<std::uint32_t>(sum);
    return got == 0;
}

std::string listReplyBody(unsigned entries)
{
    std::string body(kDeclaration);
    body += "<SR_LIST>";
    char name[32];
    for (unsigned i = 0; i < entries; ++i) {
        std::snprintf(name, sizeof name, "file%05u.dat", i);
        const std::string abs = std::string(kListPath) + "/" + name;
        const std::string size = std::to_string(1000u + i * 7u);
        body += "<FILEINFO filetype=\"FILE\" size=\"" + size + "\" date=\"2026-01-02T03:04:05Z\" name=\"" + name +
                "\" dirpath=\"" + kListPath + "\" abspath=\"" + abs + "\"><PATH name=\"" + name + "\" dirpath=\"" +
                kListPath + "\" abspath=\"" + abs + "\"/></FILEINFO>";
    }
    body += "</SR_LIST>";
    return body;
}

}  // namespace bench
