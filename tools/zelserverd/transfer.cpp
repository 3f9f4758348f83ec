#include "transfer.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "framing.h"

namespace zelserverd {

namespace {
constexpr std::size_t kChunk = 131072;
}

TempFile::TempFile(TempFile&& other) noexcept : fd_(std::move(other.fd_)), path_(std::move(other.path_))
{
    other.path_.clear();
}

TempFile& TempFile::operator=(TempFile&& other) noexcept
{
    if (this != &other) {
        discard();
        fd_ = std::move(other.fd_);
        path_ = std::move(other.path_);
        other.path_.clear();
    }
    return *this;
}

TempFile::~TempFile() { discard(); }

std::string TempFile::create(const std::string& dir)
{
    discard();
    std::string pattern = dir + "/" + std::string(kTempPrefix) + "XXXXXX";
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    int fd = ::mkostemp(name.data(), O_CLOEXEC);
    if (fd < 0)
        return "cannot create a temporary file in '" + dir + "': " + std::strerror(errno);
    fd_.reset(fd);
    path_ = name.data();
    return {};
}

std::string TempFile::commit(const std::string& destination)
{
    if (!fd_.valid())
        return "no temporary file to commit";
    if (::fsync(fd_.get()) != 0)
        return std::string("cannot flush file: ") + std::strerror(errno);
    ::fchmod(fd_.get(), 0644);
    bool moved = ::rename(path_.c_str(), destination.c_str()) == 0;
    if (!moved && !(errno == EXDEV && copyInto(destination)))
        return "cannot move file into place: " + std::string(std::strerror(errno));
    if (moved)
        path_.clear();
    discard();  // removes the temporary only when it was copied rather than moved
    // The rename is durable only once the directory is on disk too; until then a power loss could
    // lose an acknowledged file.
    std::string dir = destination.substr(0, destination.rfind('/') + 1);
    UniqueFd dirFd(::open(dir.empty() ? "." : dir.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    if (!dirFd.valid() || ::fsync(dirFd.get()) != 0)
        return "cannot flush directory: " + std::string(std::strerror(errno));
    return {};
}

// A destination on another file system than the temporaries (a shared resource mounted elsewhere)
// gets the content copied into a second temporary beside it, then renamed: still all or nothing.
bool TempFile::copyInto(const std::string& destination)
{
    TempFile beside;
    std::string dir = destination.substr(0, destination.rfind('/') + 1);
    if (!beside.create(dir.empty() ? "." : dir).empty())
        return false;
    char buffer[65536];
    off_t offset = 0;
    for (ssize_t n; (n = ::pread(fd_.get(), buffer, sizeof buffer, offset)) != 0; offset += n)
        if (n < 0 || ::write(beside.fd(), buffer, static_cast<std::size_t>(n)) != n)
            return false;
    int saved = errno;
    bool ok = beside.commit(destination).empty();
    errno = saved;
    return ok;
}

void TempFile::discard()
{
    fd_.reset();
    if (!path_.empty())
        ::unlink(path_.c_str());
    path_.clear();
}

UploadResult receiveUpload(FrameIo& io, const std::string& dir, bool checkCrc, std::uint64_t maxBytes)
{
    UploadResult result;
    std::string error = result.file.create(dir);
    if (!error.empty()) {
        result.outcome = TransferOutcome::Refused;
        result.message = error;
        return result;
    }
    if (!io.writeFrame(ackPayload()))
        return result;
    std::string headerText;
    if (io.readFrame(headerText) != FrameStatus::Ok)
        return result;
    std::optional<FileHeader> header = parseFileHeader(headerText);
    if (!header)
        return result;  // a bad header leaves the stream in an unknown state
    if (header->length > maxBytes) {
        result.outcome = TransferOutcome::Refused;
        result.message = "file of " + std::to_string(header->length) + " bytes exceeds the limit of " +
                         std::to_string(maxBytes) + " bytes";
        return result;
    }
    if (!io.writeFrame(ackPayload()))
        return result;
    std::vector<char> buffer(kChunk);
    Crc32 crc;
    std::uint64_t remaining = header->length;
    while (remaining > 0) {
        std::size_t n = remaining < kChunk ? static_cast<std::size_t>(remaining) : kChunk;
        if (!io.readRaw(buffer.data(), n))
            return result;
        crc.update(buffer.data(), n);
        const char* p = buffer.data();
        std::size_t left = n;
        while (error.empty() && left > 0) {
            ssize_t w = ::write(result.file.fd(), p, left);
            if (w < 0 && errno == EINTR)
                continue;
            if (w <= 0) {
                // Keep reading so the connection stays in step, then refuse.
                error = std::string("cannot write file: ") + std::strerror(errno);
                break;
            }
            p += w;
            left -= static_cast<std::size_t>(w);
        }
        remaining -= n;
    }
    result.length = header->length;
    result.outcome = TransferOutcome::Refused;
    if (!error.empty()) {
        result.message = error;
    } else if (checkCrc && crc.value() != header->crc) {
        result.message = "CRC mismatch: announced " + std::to_string(header->crc) + ", received data has " +
                         std::to_string(crc.value());
    } else {
        result.outcome = TransferOutcome::Ok;
        return result;
    }
    result.file.discard();
    return result;
}

TransferOutcome sendDownload(FrameIo& io, int fd, std::string& message)
{
    struct stat info {};
    if (::fstat(fd, &info) != 0 || !S_ISREG(info.st_mode)) {
        message = "not a regular file";
        return TransferOutcome::Refused;
    }
    if (static_cast<std::uint64_t>(info.st_size) > UINT32_MAX) {
        message = "file is too large to transfer (4 GiB or more)";
        return TransferOutcome::Refused;
    }
    auto length = static_cast<std::uint64_t>(info.st_size);
    std::vector<char> buffer(kChunk);
    Crc32 crc;
    for (std::uint64_t offset = 0; offset < length;) {
        // Never past `length`: a file that grows meanwhile (a running job's log) is sent as it
        // was when measured, and the CRC must cover exactly the bytes announced.
        std::size_t want = static_cast<std::size_t>(length - offset < buffer.size() ? length - offset : buffer.size());
        ssize_t n = ::pread(fd, buffer.data(), want, static_cast<off_t>(offset));
        if (n <= 0) {
            message = "cannot read file";
            return TransferOutcome::Refused;
        }
        crc.update(buffer.data(), static_cast<std::size_t>(n));
        offset += static_cast<std::uint64_t>(n);
    }
    if (!io.writeFrame(fileHeaderPayload(length, crc.value())))
        return TransferOutcome::Lost;
    std::string ack;
    if (io.readFrame(ack) != FrameStatus::Ok || !isAck(ack))
        return TransferOutcome::Lost;
    for (std::uint64_t offset = 0; offset < length;) {
        std::size_t want = static_cast<std::size_t>(length - offset < buffer.size() ? length - offset : buffer.size());
        ssize_t n = ::pread(fd, buffer.data(), want, static_cast<off_t>(offset));
        // The header promised `length` bytes; a file that shrank meanwhile cannot keep that promise.
        if (n <= 0)
            return TransferOutcome::Lost;
        if (!io.writeRaw(buffer.data(), static_cast<std::size_t>(n)))
            return TransferOutcome::Lost;
        offset += static_cast<std::uint64_t>(n);
    }
    if (io.readFrame(ack) != FrameStatus::Ok || !isAck(ack))
        return TransferOutcome::Lost;
    return TransferOutcome::Ok;
}

}  // namespace zelserverd
