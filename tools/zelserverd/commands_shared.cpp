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

// Reads the "PATH" document under `valueName` and confines it to the area.
std::optional<Reply> resolvePath(CommandContext& context, const SharedArea& area, std::string_view valueName,
                                 AreaPath& out)
{
    const std::string* value = context.request.find(valueName);
    if (!value)
        return Reply::error("missing value \"" + std::string(valueName) + "\"");
    std::string clientPath;
    std::string error = pathFromDocument(*value, clientPath);
    if (error.empty())
        error = area.resolve(clientPath, out);
    if (!error.empty())
        return Reply::error(error);
    return std::nullopt;
}

// What a shared-resource command names: always its area ("srName"), and the paths in it that
// it works on, checked in this order.
struct Wants {
    bool path = false;         // "srPath"
    bool source = false;       // "srSrcPath"
    bool destination = false;  // "srDestPath"
};

struct Target {
    const SharedArea* area = nullptr;
    AreaPath path;
    AreaPath source;
    AreaPath destination;
};

// The one way a handler learns what its request names: the failure reply, or nothing with
// `target` filled.
std::optional<Reply> resolve(CommandContext& context, const Wants& wants, Target& target)
{
    Reply failure;
    auto name = context.required("srName", failure);
    if (!name)
        return failure;
    target.area = context.server.findArea(*name);
    if (!target.area)
        return Reply::error("unknown shared resource '" + *name + "'");
    const SharedArea& area = *target.area;
    std::optional<Reply> refused;
    if (wants.path)
        refused = resolvePath(context, area, "srPath", target.path);
    if (!refused && wants.source)
        refused = resolvePath(context, area, "srSrcPath", target.source);
    if (!refused && wants.destination)
        refused = resolvePath(context, area, "srDestPath", target.destination);
    return refused;
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

Reply listResources(CommandContext& context)
{
    return Reply::ok(replyDocument("SR_GET_SHAREDRESOURCES", [&](pugi::xml_node root) {
        for (const auto& area : context.server.areas)
            appendSharedResource(root, area.config());
    }));
}

Reply getResource(CommandContext& context)
{
    Reply failure;
    auto name = context.required("srName", failure);
    if (!name)
        return failure;
    const SharedArea* area = context.server.findArea(*name);
    // An unknown name is answered with a document without the element: the client reads it as
    // "not found" rather than as a failure.
    return Reply::ok(replyDocument("SR_GET_SHAREDRESOURCE", [&](pugi::xml_node root) {
        if (area)
            appendSharedResource(root, area->config());
    }));
}

Reply exists(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.path = true}, t))
        return *failure;
    struct stat info {};
    return Reply::boolean(statPath(t.path, info));
}

Reply getInfo(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.path = true}, t))
        return *failure;
    struct stat info {};
    if (!statPath(t.path, info))
        return Reply::error("'" + t.path.relative + "' does not exist");
    return Reply::ok(
        replyDocument("SR_GET", [&](pugi::xml_node root) { appendFileInfo(root, t.path.relative, info); }));
}

Reply list(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.path = true}, t))
        return *failure;
    const AreaPath& path = t.path;
    struct stat info {};
    if (!statPath(path, info))
        return Reply::error("'" + path.relative + "' does not exist");
    if (!S_ISDIR(info.st_mode))
        return Reply::error("'" + path.relative + "' is not a directory");
    std::error_code ec;
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(path.full, ec)) {
        std::string name = entry.path().filename().string();
        if (name.rfind(kTempPrefix, 0) != 0)
            names.push_back(name);
    }
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

Reply makeDirectory(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.path = true}, t))
        return *failure;
    std::error_code ec;
    fs::create_directories(t.path.full, ec);
    if (ec || !fs::is_directory(t.path.full))
        return Reply::error("cannot make directory '" + t.path.relative + "'" +
                            (ec ? ": " + ec.message() : std::string()));
    return Reply::ok();
}

Reply removePath(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.path = true}, t))
        return *failure;
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

Reply copyOrMove(CommandContext& context, bool move)
{
    Target t;
    if (auto failure = resolve(context, {.source = true, .destination = true}, t))
        return *failure;
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
        return copyFile(source.full, destination.full, parent);
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

Reply copy(CommandContext& context) { return copyOrMove(context, false); }
Reply move(CommandContext& context) { return copyOrMove(context, true); }

Reply upload(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.destination = true}, t))
        return *failure;
    std::string parent;
    if (auto failure = existingParent(*t.area, t.destination, parent))
        return *failure;
    struct stat info {};
    if (statPath(t.destination, info) && S_ISDIR(info.st_mode))
        return Reply::error("'" + t.destination.relative + "' is a directory");
    bool checkCrc = context.request.get("itemFileCRCCheckingEnabled") == "true";
    UploadResult result = receiveUpload(context.io, parent, checkCrc, context.server.config.maxFileBytes);
    if (result.outcome == TransferOutcome::Lost)
        return Reply::close();
    if (result.outcome == TransferOutcome::Refused)
        return Reply::error(result.message);
    std::string error = result.file.commit(t.destination.full);
    return error.empty() ? Reply::ok() : Reply::error(error);
}

Reply download(CommandContext& context)
{
    Target t;
    if (auto failure = resolve(context, {.source = true}, t))
        return *failure;
    UniqueFd fd(::open(t.source.full.c_str(), O_RDONLY | O_CLOEXEC));
    if (!fd.valid())
        return Reply::error("cannot open '" + t.source.relative + "'");
    std::string message;
    TransferOutcome outcome = sendDownload(context.io, fd.get(), message);
    if (outcome == TransferOutcome::Lost)
        return Reply::close();
    if (outcome == TransferOutcome::Refused)
        return Reply::error("'" + t.source.relative + "': " + message);
    return Reply::ok();
}

}  // namespace

std::vector<CommandSpec> sharedResourceCommands()
{
    return {
        {"SR_GET_SHAREDRESOURCES", kRightSharedRead, listResources},
        {"SR_GET_SHAREDRESOURCE", kRightSharedRead, getResource},
        {"SR_EXISTS", kRightSharedRead, exists},
        {"SR_GET", kRightSharedRead, getInfo},
        {"SR_LIST", kRightSharedRead, list},
        {"SR_DOWNLOAD", kRightSharedRead, download},
        {"SR_MAKE", kRightSharedWrite, makeDirectory},
        {"SR_DELETE", kRightSharedWrite, removePath},
        {"SR_COPY", kRightSharedWrite, copy},
        {"SR_MOVE", kRightSharedWrite, move},
        {"SR_UPLOAD", kRightSharedWrite, upload},
    };
}

}  // namespace zelserverd
