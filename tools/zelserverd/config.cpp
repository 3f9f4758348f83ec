#include "config.h"

#include <filesystem>
#include <fstream>
#include <optional>
#include <sstream>

#include "auth.h"
#include "net.h"
#include "util.h"

namespace zelserverd {

const UserConfig* Config::findUser(std::string_view name) const
{
    for (const auto& user : users)
        if (user.name == name)
            return &user;
    return nullptr;
}

const SharedResourceConfig* Config::findSharedResource(std::string_view name) const
{
    for (const auto& area : sharedResources)
        if (area.name == name)
            return &area;
    return nullptr;
}

const JobServiceConfig* Config::findJobService(std::string_view name) const
{
    for (const auto& service : jobServices)
        if (service.name == name)
            return &service;
    return nullptr;
}

namespace {

std::vector<std::string> splitList(std::string_view text)
{
    std::vector<std::string> items;
    for (const std::string& piece : split(text, ',')) {
        std::string item = trim(piece);
        if (!item.empty())
            items.push_back(item);
    }
    return items;
}

class Parser {
public:
    Parser(const std::string& baseDir, Config& out) : baseDir_(baseDir), out_(out) {}

    std::string run(std::string_view text)
    {
        std::istringstream lines{std::string(text)};
        std::string line;
        while (std::getline(lines, line)) {
            ++lineNo_;
            std::string error = handleLine(trim(line));
            if (!error.empty())
                return "line " + std::to_string(lineNo_) + ": " + error;
        }
        return finish();
    }

private:
    std::string handleLine(const std::string& line)
    {
        if (line.empty() || line[0] == '#' || line[0] == ';')
            return {};
        if (line.front() == '[')
            return openSection(line);
        std::size_t eq = line.find('=');
        if (eq == std::string::npos)
            return "expected 'key = value'";
        std::string key = trim(std::string_view(line).substr(0, eq));
        std::string value = trim(std::string_view(line).substr(eq + 1));
        if (key.empty())
            return "empty key";
        return setValue(key, value);
    }

    std::string openSection(const std::string& line)
    {
        if (line.back() != ']')
            return "section header must end with ']'";
        std::string inner = trim(std::string_view(line).substr(1, line.size() - 2));
        std::size_t space = inner.find(' ');
        kind_ = inner.substr(0, space);
        name_ = space == std::string::npos ? std::string() : trim(inner.substr(space + 1));
        if (kind_ == "server")
            return name_.empty() ? std::string() : "[server] takes no name";
        if (name_.empty())
            return "section [" + kind_ + "] needs a name";
        if (kind_ == "user") {
            if (out_.findUser(name_))
                return "user '" + name_ + "' defined twice";
            out_.users.push_back(UserConfig{name_, {}, {}});
        } else if (kind_ == "role") {
            if (out_.roleRights.count(name_))
                return "role '" + name_ + "' defined twice";
            out_.roleRights[name_];
        } else if (kind_ == "sharedresource") {
            if (out_.findSharedResource(name_))
                return "shared resource '" + name_ + "' defined twice";
            out_.sharedResources.push_back(SharedResourceConfig{name_, {}, name_, {}});
        } else if (kind_ == "jobservice") {
            if (out_.findJobService(name_))
                return "job service '" + name_ + "' defined twice";
            out_.jobServices.push_back(JobServiceConfig{name_, {}});
        } else {
            return "unknown section kind '" + kind_ + "'";
        }
        return {};
    }

    std::string setValue(const std::string& key, const std::string& value)
    {
        if (kind_.empty())
            return "'" + key + "' outside of any section";
        if (kind_ == "server")
            return setServer(key, value);
        if (kind_ == "user")
            return setUser(out_.users.back(), key, value);
        if (kind_ == "role") {
            if (key != "rights")
                return "unknown role key '" + key + "'";
            for (const std::string& right : splitList(value))
                if (!rightFromName(right))
                    return "unknown right '" + right + "'";
            out_.roleRights[name_] = splitList(value);
            return {};
        }
        if (kind_ == "sharedresource")
            return setArea(out_.sharedResources.back(), key, value);
        if (key != "description")
            return "unknown job service key '" + key + "'";
        out_.jobServices.back().description = value;
        return {};
    }

    std::string setServer(const std::string& key, const std::string& value)
    {
        if (key == "listen") {
            if (!splitHostPort(value, out_.listenHost, out_.listenPort))
                return "bad listen address";
            return {};
        }
        if (key == "max_request_bytes") {
            auto n = parseDecimal(value, UINT32_MAX);
            if (!n || *n < 1024)
                return "max_request_bytes must be at least 1024";
            out_.maxRequestBytes = static_cast<std::uint32_t>(*n);
            return {};
        }
        if (key == "max_file_bytes") {
            auto n = parseDecimal(value, UINT32_MAX);
            if (!n)
                return "max_file_bytes must be a number up to 4294967295";
            out_.maxFileBytes = *n;
            return {};
        }
        if (auto limit = countSetting(key)) {
            auto n = parseDecimal(value, limit->max);
            if (!n || *n < limit->min)
                return key + " must be " + std::to_string(limit->min) + " to " + std::to_string(limit->max);
            *limit->target = static_cast<unsigned>(*n);
            return {};
        }
        if (key == "job_user") {
            out_.jobUser = value;
            return {};
        }
        if (key == "sso_secret") {
            out_.ssoSecret = value;
            return {};
        }
        return "unknown server key '" + key + "'";
    }

    struct CountSetting {
        unsigned* target;
        std::uint64_t min;
        std::uint64_t max;
    };
    std::optional<CountSetting> countSetting(const std::string& key)
    {
        if (key == "workers")
            return CountSetting{&out_.workers, 1, 64};
        if (key == "job_timeout_seconds")
            return CountSetting{&out_.jobTimeoutSeconds, 0, 86400 * 7};
        if (key == "max_connections")
            return CountSetting{&out_.maxConnections, 1, 10000};
        if (key == "idle_timeout_seconds")
            return CountSetting{&out_.idleTimeoutSeconds, 0, 86400};
        if (key == "io_timeout_seconds")
            return CountSetting{&out_.ioTimeoutSeconds, 1, 3600};
        return std::nullopt;
    }

    static std::string setUser(UserConfig& user, const std::string& key, const std::string& value)
    {
        if (key == "password") {
            user.password = value;
            return {};
        }
        if (key == "roles") {
            user.roles = splitList(value);
            return {};
        }
        return "unknown user key '" + key + "'";
    }

    std::string setArea(SharedResourceConfig& area, const std::string& key, const std::string& value)
    {
        if (key == "path") {
            std::filesystem::path path(value);
            if (path.is_relative())
                path = std::filesystem::path(baseDir_) / path;
            area.path = path.lexically_normal().string();
            return {};
        }
        if (key == "display_name") {
            area.displayName = value;
            return {};
        }
        if (key == "description") {
            area.description = value;
            return {};
        }
        return "unknown shared resource key '" + key + "'";
    }

    std::string finish()
    {
        for (const auto& user : out_.users) {
            if (user.password.empty())
                return "user '" + user.name + "' has no password";
            if (user.roles.empty())
                return "user '" + user.name + "' has no roles";
            for (const auto& role : user.roles)
                if (!out_.roleRights.count(role) && !builtInRoleRights(role))
                    return "user '" + user.name + "' has unknown role '" + role + "'";
        }
        for (const auto& area : out_.sharedResources)
            if (area.path.empty())
                return "shared resource '" + area.name + "' has no path";
        if (out_.jobServices.empty())
            out_.jobServices.push_back(JobServiceConfig{std::string(kDefaultJobService), {}});
        return {};
    }

    std::string baseDir_;
    Config& out_;
    std::string kind_;
    std::string name_;
    int lineNo_ = 0;
};

}  // namespace

std::string parseConfig(std::string_view text, const std::string& baseDir, Config& out)
{
    return Parser(baseDir, out).run(text);
}

std::string loadConfigFile(const std::string& path, Config& out)
{
    std::ifstream in(path, std::ios::binary);
    if (!in)
        return "cannot read config file '" + path + "'";
    std::stringstream text;
    text << in.rdbuf();
    std::string base = std::filesystem::absolute(path).parent_path().string();
    std::string error = parseConfig(text.str(), base, out);
    return error.empty() ? error : path + ": " + error;
}

}  // namespace zelserverd
