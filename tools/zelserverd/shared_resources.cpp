#include "shared_resources.h"

#include <sys/stat.h>

#include <cstdlib>
#include <filesystem>

#include "util.h"
#include "xml.h"

namespace zelserverd {

SharedArea::SharedArea(const SharedResourceConfig& config, std::string& error) : config_(config)
{
    std::error_code ec;
    root_ = std::filesystem::canonical(config.path, ec).string();
    if (ec)
        error = "shared resource '" + config.name + "': " + ec.message();
}

bool SharedArea::inside(const std::string& realPath) const
{
    return realPath == root_ || (realPath.size() > root_.size() && realPath.compare(0, root_.size(), root_) == 0 &&
                                 realPath[root_.size()] == '/');
}

std::string SharedArea::resolve(std::string_view clientPath, AreaPath& out) const
{
    std::string text(clientPath);
    // Clients on Windows write backslashes; on this side both separate components.
    for (char& c : text)
        if (c == '\\')
            c = '/';
    // Paths are rooted at the area: a leading "/" names the area's top, as the client's path objects
    // write it. Paths of the host itself (a network share, a drive letter) are never taken.
    if (text.rfind("//", 0) == 0 || (text.size() >= 2 && text[1] == ':'))
        return "absolute path '" + std::string(clientPath) + "' is not allowed";
    std::vector<std::string> components;
    for (const std::string& part : split(text, '/')) {
        if (part.empty() || part == ".")
            continue;
        if (part == "..")
            return "path '" + std::string(clientPath) + "' may not contain '..'";
        components.push_back(part);
    }
    std::string full = root_;
    std::string relative;
    bool existing = true;  // below a missing component nothing exists that could be a link
    for (const std::string& part : components) {
        full += "/" + part;
        relative += (relative.empty() ? "" : "/") + part;
        struct stat info {};
        if (existing && ::lstat(full.c_str(), &info) != 0)
            existing = false;
        if (!existing || !S_ISLNK(info.st_mode))
            continue;
        char* real = ::realpath(full.c_str(), nullptr);
        bool ok = real && inside(real);
        std::free(real);
        if (!ok)
            return "symbolic link '" + relative + "' points outside shared resource '" + config_.name + "'";
    }
    out.full = full;
    out.relative = relative;
    return {};
}

std::string pathFromDocument(std::string_view text, std::string& path)
{
    pugi::xml_document doc;
    std::string error = parseXml(text, doc);
    if (!error.empty())
        return "path value is not a PATH document: " + error;
    pugi::xml_node element = findElement(doc, "PATH");
    if (!element)
        return "path value holds no PATH element";
    path = element.attribute("abspath").value();
    if (path.empty()) {
        std::string dir = element.attribute("dirpath").value();
        std::string name = element.attribute("name").value();
        path = dir.empty() ? name : dir + "/" + name;
    }
    return {};
}

}  // namespace zelserverd
