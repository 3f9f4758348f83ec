// Shared resources ("SR_" commands): listing areas and working with files and directories in
// them. Paths arrive as "PATH" documents and are confined to their area.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <filesystem>

#include "commands.h"
#include "server.h"
#include "transfer.h"
#include "util.h"
#include "xml.h"

namespace zelserverd {

namespace fs = std::filesystem;

namespace {

void appendSharedResource(pugi::xml_node parent, const SharedResourceConfig& area)
{
    pugi::xml_node element = parent.append_child("SHAREDRESOURCE");
    element.append_attribute("name") = area.name.c_str();
    element.append_attribute("displayname") = area.displayName.c_str();
    element.append_attribute("description") = area.description.c_str();
}

std::string parentOf(const std::string& relative)
{
    std::size_t slash = relative.rfind('/');
    return slash == std::string::npos ? std::string() : relative.substr(0, slash);
}

std::string nameOf(const std::string& relative)
{
    std::size_t slash = relative.rfind('/');
    return slash == std::string::npos ? relative : relative.substr(slash + 1);
}

// One "FILEINFO" element. The path is given both as attributes and as a "PATH" child, in the
// same relative form that the commands accept back.
void appendFileInfo(pugi::xml_node parent, const std::string& relative, const struct stat& info)
{
    pugi::xml_node element = parent.append_child("FILEINFO");
    bool dir = S_ISDIR(info.st_mode);
    element.append_attribute("filetype") = dir ? "DIR" : "FILE";
    element.append_attribute("size") = std::to_string(dir ? 0 : static_cast<unsigned long long>(info.st_size)).c_str();
    element.append_attribute("date") = isoTime(info.st_mtime).c_str();
    std::string name = nameOf(relative);
    std::string dirPath = parentOf(relative);
    element.append_attribute("name") = name.c_str();
    element.append_attribute("dirpath") = dirPath.c_str();
    element.append_attribute("abspath") = relative.c_str();
    pugi::xml_node path = element.append_child("PATH");
    path.append_attribute("name") = name.c_str();
    path.append_attribute("dirpath") = dirPath.c_str();
    path.append_attribute("abspath") = relative.c_str();
}

bool statPath(const AreaPath& path, struct stat& info) { return ::stat(path.full.c_str(), &info) == 0; }

// The directory that will hold `path`; it must exist already.
std::optional<Reply> existingParent(const SharedArea& area, const AreaPath& path, std::string& parentDir)
{
    if (path.relative.empty())
        return Reply::error("the shared resource itself cannot be replaced");
    AreaPath parent;
    std::string error = area.resolve(parentOf(path.relative), parent);
    struct stat info {};
    if (!error.empty() || ::stat(parent.full.c_str(), &info) != 0 || !S_ISDIR(info.st_mode))
        return Reply::error(error.empty() ? "directory '" + parentOf(path.relative) + "' does not exist" : error);
    parentDir = parent.full;
    return std::nullopt;
}

Reply listResources(CommandContext& context, const Target&)
{
    return Reply::ok(replyDocument("SR_GET_SHAREDRESOURCES", [&](pugi::xml_node root) {
        for (const auto& area : context.server.areas)
            appendSharedResource(root, area.config());
    }));
}

Reply getResource(CommandContext& context, const Target& t)
{
    const SharedArea* area = context.server.findArea(t.areaName);
    // An unknown name is answered with a document without the element: the client reads it as
    // "not found" rather than as a failure.
    return Reply::ok(replyDocument("SR_GET_SHAREDRESOURCE", [&](pugi::xml_node root) {
        if (area)
            appendSharedResource(root, area->config());
    }));
}

Reply exists(CommandContext& context, const Target& t)
{
    struct stat info {};
    return Reply::boolean(statPath(t.path, info));
}

Reply getInfo(CommandContext& context, const Target& t)
{
    struct stat info {};
    if (!statPath(t.path, info))
        return Reply::error("'" + t.path.relative + "' does not exist");
    return Reply::ok(
        replyDocument("SR_GET", [&](pugi::xml_node root) { appendFileInfo(root, t.path.relative, info); }));
}

Reply list(CommandContext& context, const Target& t)
{
    const AreaPath& path = t.path;
    struct stat info {};
    if (!statPath(path, info))
        return Reply::error("'" + path.relative + "' does not exist");
    if (!S_ISDIR(info.st_mode))
        return Reply::error("'" + path.relative + "' is not a directory");
    std::error_code ec;
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(path.full, ec))
        names.push_back(entry.path().filename().string());
    if (ec)
        return Reply::error("cannot list '" + path.relative + "': " + ec.message());
    std::sort(names.begin(), names.end());
    return Reply::ok(replyDocument("SR_LIST", [&](pugi::xml_node root) {
        for (const auto& name : names) {
            std::string relative = path.relative.empty() ? name : path.relative + "/" + name;
            struct stat entryInfo {};
            // Links are described by what they point to, and only when that stays in the area.
            AreaPath checked;
            if (t.area->resolve(relative, checked).empty() && ::stat(checked.full.c_str(), &entryInfo) == 0)
                appendFileInfo(root, relative, entryInfo);
        }
    }));
}

Reply makeDirectory(CommandContext& context, const Target& t)
{
    std::error_code ec;
    fs::create_directories(t.path.full, ec);
    if (ec || !fs::is_directory(t.path.full))
        return Reply::error("cannot make directory '" + t.path.relative + "'" +
                            (ec ? ": " + ec.message() : std::string()));
    return Reply::ok();
}

Reply removePath(CommandContext& context, const Target& t)
{
    if (t.path.relative.empty())
        return Reply::error("the shared resource itself cannot be deleted");
    std::error_code ec;
    // remove_all does not follow symbolic links: a link is removed, never what it points to.
    std::uintmax_t removed = fs::remove_all(t.path.full, ec);
    if (ec)
        return Reply::error("cannot delete '" + t.path.relative + "': " + ec.message());
    return Reply::boolean(removed > 0);
}

Reply copyFile(const std::string& from, const std::string& to, const std::string& dir)
{
    UniqueFd in(::open(from.c_str(), O_RDONLY | O_CLOEXEC));
    TempFile temp;
    std::string error = in.valid() ? temp.create(dir) : std::string("cannot open source");
    char buffer[65536];
    while (error.empty()) {
        ssize_t n = ::read(in.get(), buffer, sizeof buffer);
        if (n == 0)
            break;
        if (n < 0 || ::write(temp.fd(), buffer, static_cast<std::size_t>(n)) != n)
            error = std::string("copy failed: ") + std::strerror(errno);
    }
    if (error.empty())
        error = temp.commit(to);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply copyOrMove(CommandContext& context, const Target& t, bool move)
{
    const AreaPath& source = t.source;
    const AreaPath& destination = t.destination;
    struct stat info {};
    if (!statPath(source, info))
        return Reply::error("'" + source.relative + "' does not exist");
    if (source.relative.empty())
        return Reply::error("the shared resource itself cannot be copied or moved");
    std::string parent;
    if (auto failure = existingParent(*t.area, destination, parent))
        return *failure;
    if (move) {
        if (::rename(source.full.c_str(), destination.full.c_str()) != 0)
            return Reply::error("cannot move '" + source.relative + "' to '" + destination.relative +
                                "': " + std::strerror(errno));
        return Reply::ok();
    }
    if (S_ISREG(info.st_mode))
        return copyFile(source.full, destination.full, context.server.tempDir);
    std::error_code ec;
    if (fs::exists(destination.full))
        return Reply::error("'" + destination.relative + "' already exists");
    fs::copy(source.full, destination.full, fs::copy_options::recursive | fs::copy_options::copy_symlinks, ec);
    if (ec) {
        fs::remove_all(destination.full);
        return Reply::error("cannot copy '" + source.relative + "': " + ec.message());
    }
    return Reply::ok();
}

Reply copy(CommandContext& context, const Target& t) { return copyOrMove(context, t, false); }
Reply move(CommandContext& context, const Target& t) { return copyOrMove(context, t, true); }

Reply upload(CommandContext& context, const Target& t)
{
    std::string parent;
    if (auto failure = existingParent(*t.area, t.destination, parent))
        return *failure;
    struct stat info {};
    if (statPath(t.destination, info) && S_ISDIR(info.st_mode))
        return Reply::error("'" + t.destination.relative + "' is a directory");
    UploadResult result;
    if (auto failure = receiveCommandUpload(context, "itemFileCRCCheckingEnabled", result))
        return *failure;
    std::string error = result.file.commit(t.destination.full);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply download(CommandContext& context, const Target& t)
{
    UniqueFd fd(::open(t.source.full.c_str(), O_RDONLY | O_CLOEXEC));
    if (!fd.valid())
        return Reply::error("cannot open '" + t.source.relative + "'");
    return sendCommandDownload(context, fd.get(), "'" + t.source.relative + "': ");
}

}  // namespace

std::vector<CommandSpec> sharedResourceCommands()
{
    constexpr std::uint32_t read = kRightSharedRead;
    constexpr std::uint32_t write = kRightSharedWrite;
    constexpr Needs path{.area = Named::Known, .path = true};
    return {
        {"SR_GET_SHAREDRESOURCES", read, {}, listResources},
        {"SR_GET_SHAREDRESOURCE", read, {.area = Named::Name}, getResource},
        {"SR_EXISTS", read, path, exists},
        {"SR_GET", read, path, getInfo},
        {"SR_LIST", read, path, list},
        {"SR_DOWNLOAD", read, {.area = Named::Known, .source = true}, download},
        {"SR_MAKE", write, path, makeDirectory},
        {"SR_DELETE", write, path, removePath},
        {"SR_COPY", write, {.area = Named::Known, .source = true, .destination = true}, copy},
        {"SR_MOVE", write, {.area = Named::Known, .source = true, .destination = true}, move},
        {"SR_UPLOAD", write, {.area = Named::Known, .destination = true}, upload},
    };
}

}  // namespace zelserverd
