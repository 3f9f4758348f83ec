#include "transport/temporary_file.h"

#include "platform/environment.h"

#include <filesystem>
#include <random>
#include <system_error>
#include <utility>

namespace zel {
namespace {

namespace fs = std::filesystem;

// Names are guessed, so a crowded directory costs a few more tries; past this many something other
// than a name clash is wrong.
constexpr int kAttempts = 100;

std::string randomLetters(std::mt19937& generator)
{
    static constexpr char kAlphabet[] = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789";
    std::uniform_int_distribution<std::size_t> pick(0, sizeof kAlphabet - 2);
    std::string letters(6, '\0');
    for (char& letter : letters) {
        letter = kAlphabet[pick(generator)];
    }
    return letters;
}

}  // namespace

std::optional<TemporaryFile> TemporaryFile::createBeside(const std::string& destination)
{
    const std::string directory = directoryFor(destination);
    const fs::path folder = directory.empty() ? fs::path(".") : fs::path(directory);
    std::random_device seed;
    std::mt19937 generator(seed());
    for (int attempt = 0; attempt < kAttempts; ++attempt) {
        const std::string path = (folder / (kPrefix + randomLetters(generator) + kSuffix)).string();
        // Created only when new: that is what makes the name ours even when another process
        // guesses the same one.
        std::FILE* writer = nullptr;
        switch (platform::createNewFile(path, &writer)) {
        case platform::NewFile::Created:
            return TemporaryFile(path, writer);
        case platform::NewFile::Exists:
            continue;
        case platform::NewFile::Failed:
            return std::nullopt;
        }
    }
    return std::nullopt;
}

std::string TemporaryFile::directoryFor(const std::string& destination)
{
    if (!destination.empty()) {
        return fs::path(destination).parent_path().string();
    }
    std::error_code error;
    const fs::path folder = fs::temp_directory_path(error);
    return error ? std::string() : folder.string();
}

TemporaryFile::TemporaryFile(TemporaryFile&& other) noexcept
    : path_(std::exchange(other.path_, std::string())), writer_(std::exchange(other.writer_, nullptr))
{}

TemporaryFile::~TemporaryFile()
{
    if (writer_ != nullptr) {
        std::fclose(writer_);
    }
    if (!path_.empty()) {
        std::error_code ignored;
        fs::remove(path_, ignored);
    }
}

std::FILE* TemporaryFile::takeWriter() { return std::exchange(writer_, nullptr); }

bool TemporaryFile::moveTo(const std::string& destination)
{
    std::error_code error;
    // A device or a pipe keeps its place: renaming over it would remove it, not write to it.
    const fs::file_status existing = fs::status(destination, error);
    if (fs::exists(existing) && !fs::is_regular_file(existing)) {
        return false;
    }
    fs::rename(path_, destination, error);
    if (error) {
        return false;
    }
    path_.clear();
    return true;
}

}  // namespace zel
