#pragma once
// The unique temporary file a download is received into, beside its destination, so that the
// destination is replaced only by a complete transfer and the finished file can be renamed onto it.
// It is deleted when the object goes, unless it was moved onto its destination or kept.

#include <cstdio>
#include <optional>
#include <string>

namespace zel {

class TemporaryFile {
public:
    // Name pattern: the six X characters are replaced to make the name unique.
    static constexpr const char* kPrefix = "wb-tmp-";
    static constexpr const char* kSuffix = ".tmp";

    // Creates a new empty file "wb-tmp-XXXXXX.tmp" in the directory of `destination` (the current
    // directory for a bare file name; the system's directory for temporary files when `destination`
    // is empty), never reusing an existing name, and keeps it open for writing. Nullopt when no such
    // file can be created there.
    static std::optional<TemporaryFile> createBeside(const std::string& destination);

    // The directory createBeside uses for `destination`.
    static std::string directoryFor(const std::string& destination);

    TemporaryFile(TemporaryFile&& other) noexcept;
    TemporaryFile& operator=(TemporaryFile&&) = delete;
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    ~TemporaryFile();

    const std::string& path() const { return path_; }

    // The stream the file was created with; the caller takes it over and closes it. Writing through
    // it rather than opening the file again matters: reopening with truncation makes some file
    // systems flush the whole file to disk when it is closed.
    std::FILE* takeWriter();

    // Renames the file onto `destination`, replacing a file there; anything there that is not a
    // regular file (a folder, a device, a pipe) is never replaced. True when done; the file is then
    // no longer this object's. On false it stays this object's (and is deleted with it).
    bool moveTo(const std::string& destination);
    // Leaves the file where it is when this object goes.
    void keep() { path_.clear(); }

private:
    TemporaryFile(std::string path, std::FILE* writer) : path_(std::move(path)), writer_(writer) {}

    std::string path_;  // empty once the file is no longer ours
    std::FILE* writer_ = nullptr;
};

}  // namespace zel
