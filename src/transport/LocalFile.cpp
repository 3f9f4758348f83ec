#include "transport/LocalFile.h"

#include "transport/crc32.h"

#include <memory>
#include <utility>

namespace zel {

namespace {

// Large enough that the checksum pass costs few system calls, small enough to sit on the heap once.
constexpr std::size_t kCrcBlockSize = 256 * 1024;

}  // namespace

LocalFile::LocalFile(std::string path) : path_(std::move(path)), mode_(Mode::Read)
{
    stream_.open(path_, std::ios::in | std::ios::binary);
}

// Files are written through a C stream, so that a download can go on through the stream its
// temporary file was created with. Content arrives in whole transfer chunks: a stream buffer would
// only copy a page of each chunk and split it into two system calls (measured: about a tenth of a
// download's time).
LocalFile::LocalFile(std::string path, std::FILE* writer) : path_(std::move(path)), mode_(Mode::Write), writer_(writer)
{
    if (writer_ != nullptr) {
        std::setvbuf(writer_, nullptr, _IONBF, 0);
    }
}

LocalFile::~LocalFile()
{
    if (writer_ != nullptr) {
        std::fclose(writer_);
    }
}

std::optional<std::uint64_t> LocalFile::size()
{
    if (!isOpen()) {
        return std::nullopt;
    }
    stream_.clear();
    stream_.seekg(0, std::ios::end);
    const std::streamoff end = stream_.tellg();
    if (!stream_ || end < 0 || !rewind()) {
        stream_.clear();
        return std::nullopt;
    }
    return static_cast<std::uint64_t>(end);
}

bool LocalFile::rewind()
{
    if (!isOpen()) {
        return false;
    }
    stream_.clear();
    stream_.seekg(0, std::ios::beg);
    return static_cast<bool>(stream_);
}

std::optional<std::size_t> LocalFile::read(char* buffer, std::size_t count)
{
    if (!isOpen() || mode_ != Mode::Read) {
        return std::nullopt;
    }
    stream_.read(buffer, static_cast<std::streamsize>(count));
    const auto got = static_cast<std::size_t>(stream_.gcount());
    if (stream_.bad()) {
        return std::nullopt;
    }
    // A short read sets failbit together with eofbit; that is the end of the file, not an error.
    if (stream_.eof()) {
        stream_.clear();
    } else if (stream_.fail()) {
        return std::nullopt;
    }
    return got;
}

bool LocalFile::write(const char* data, std::size_t count)
{
    if (writer_ == nullptr) {
        return false;
    }
    const std::size_t done = std::fwrite(data, 1, count, writer_);
    written_ += done;
    return done == count;
}

bool LocalFile::close()
{
    if (!isOpen()) {
        return false;
    }
    if (mode_ == Mode::Write) {
        const bool flushed = std::fflush(writer_) == 0 && std::ferror(writer_) == 0;
        const bool closed = std::fclose(writer_) == 0;
        writer_ = nullptr;
        return flushed && closed;
    }
    const bool good = !stream_.bad();
    stream_.close();
    return good && !stream_.fail();
}

std::optional<std::uint32_t> LocalFile::crc32() const
{
    std::ifstream input(path_, std::ios::in | std::ios::binary);
    if (!input) {
        return std::nullopt;
    }
    const std::unique_ptr<char[]> block(new (std::nothrow) char[kCrcBlockSize]);
    if (!block) {
        return std::nullopt;
    }
    Crc32 crc;
    for (;;) {
        input.read(block.get(), static_cast<std::streamsize>(kCrcBlockSize));
        const auto got = static_cast<std::size_t>(input.gcount());
        if (input.bad()) {
            return std::nullopt;
        }
        crc.update(block.get(), got);
        if (input.eof()) {
            return crc.value();
        }
        if (input.fail()) {
            return std::nullopt;
        }
    }
}

}  // namespace zel
