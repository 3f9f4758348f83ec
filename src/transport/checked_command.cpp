#include "transport/checked_command.h"

#include <utility>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "api/status.h"

namespace zel {

CheckedCommand::CheckedCommand(IZELServerChannel* channel, std::string keyword, Where where)
    : channel_(channel), keyword_(std::move(keyword)), where_(where)
{}

CheckedCommand& CheckedCommand::check(const Check& check)
{
    if (failure_.holds && !check.holds) {
        failure_ = check;
    }
    return *this;
}

CheckedCommand& CheckedCommand::check(bool condition, unsigned number, std::vector<std::string> parameters, Where where)
{
    return check(Check{condition, number, std::move(parameters), where});
}

CheckedCommand& CheckedCommand::require(const IZELServerString& text, Where where)
{
    return require(text.length() > 0, where);
}

CheckedCommand& CheckedCommand::require(bool condition, Where where)
{
    return check(condition, msg::kRequiredValueMissing, {}, where);
}

CheckedCommand& CheckedCommand::addValue(Value value)
{
    values_.push_back(std::move(value));
    return *this;
}

CheckedCommand& CheckedCommand::add(const std::string& name, const std::string& value)
{
    return addValue([name, value](Command& command) -> IZELServerStatus* {
        command.add(name, value);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::add(const std::string& name, const IZELServerString& value)
{
    return add(name, toStdString(value));
}

CheckedCommand& CheckedCommand::addList(const std::string& name, const IZELServerStringArray& pairs)
{
    return addValue([name, &pairs](Command& command) -> IZELServerStatus* {
        command.addList(name, pairs);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::appendDirectives(const IZELServerStringArray& pairs)
{
    return addValue([&pairs](Command& command) -> IZELServerStatus* {
        command.request().appendDirectives(pairs);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::appendNotifications(const IZELServerStringArray& pairs)
{
    return addValue([&pairs](Command& command) -> IZELServerStatus* {
        command.request().appendNotifications(pairs);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::addXml(const std::string& name, const XmlWritable& object, const std::string& rootName)
{
    return addValue([name, &object, rootName](Command& command) -> IZELServerStatus* {
        command.request().addXmlValue(name, object, rootName);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::addService(const std::string& name, const IZELServerService& service)
{
    return addValue([name, &service](Command& command) -> IZELServerStatus* {
        command.request().addServicePayload(name, service);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::addRepository(const std::string& name, const IZELServerString& repositoryName,
                                              const IZELServerString& description)
{
    return addValue([name, &repositoryName, &description](Command& command) -> IZELServerStatus* {
        command.request().addRepositoryPayload(name, repositoryName, description);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::addUserToken(const std::string& name, const IZELServerUserToken& token)
{
    return addValue([name, &token](Command& command) -> IZELServerStatus* {
        command.request().addUserTokenPayload(name, token);
        return nullptr;
    });
}

CheckedCommand& CheckedCommand::addPath(const std::string& name, const IZELServerPath& path)
{
    return addValue([name, &path, where = where_](Command& command) -> IZELServerStatus* {
        const int code = command.request().addPathPayload(name, path);
        return code == 0 ? nullptr : makeStatus(static_cast<unsigned>(code), name, where);
    });
}

IZELServerStatus* CheckedCommand::run(const Exchange& exchange)
{
    if (!failure_.holds) {
        return makeStatus(failure_.number, failure_.parameters, failure_.where);
    }
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected, where_);
    }
    Command command(*channel_, keyword_);
    // A command without its request (memory exhausted) takes no values; its exchange reports that.
    if (command.ready()) {
        for (const Value& value : values_) {
            if (IZELServerStatus* refused = value(command)) {
                return refused;
            }
        }
    }
    return exchange(command);
}

IZELServerStatus* CheckedCommand::run(unsigned& flag, const Exchange& exchange, OnFailure onFailure)
{
    if (onFailure == OnFailure::kClear) {
        flag = 0;
    }
    return run(exchange);
}

IZELServerStatus* CheckedCommand::send(unsigned requestType)
{
    return run([requestType](Command& command) { return command.send(requestType); });
}

IZELServerStatus* CheckedCommand::askFlag(unsigned& flag, OnFailure onFailure)
{
    return run(
        flag,
        [&flag](Command& command) -> IZELServerStatus* {
            if (IZELServerStatus* status = command.send()) {
                return status;
            }
            command.response().readBoolean(flag);
            return nullptr;
        },
        onFailure);
}

IZELServerStatus* CheckedCommand::askObject(unsigned& found, const Reader& read, OnFailure onFailure)
{
    return run(
        found,
        [&found, &read](Command& command) -> IZELServerStatus* {
            if (IZELServerStatus* status = command.send()) {
                return status;
            }
            found = read(command.response()) == 0 ? 1 : 0;
            return nullptr;
        },
        onFailure);
}

IZELServerStatus* CheckedCommand::askList(const Reader& read)
{
    return run([&read](Command& command) -> IZELServerStatus* {
        if (IZELServerStatus* status = command.send()) {
            return status;
        }
        read(command.response());
        return nullptr;
    });
}

IZELServerStatus* CheckedCommand::askParsed(const Reader& read)
{
    return run([&read](Command& command) -> IZELServerStatus* {
        if (IZELServerStatus* status = command.send()) {
            return status;
        }
        const int code = read(command.response());
        return code == 0 ? nullptr : makeStatus(static_cast<unsigned>(code));
    });
}

IZELServerStatus* CheckedCommand::askText(IZELServerString& text)
{
    return run([&text](Command& command) -> IZELServerStatus* {
        if (IZELServerStatus* status = command.send()) {
            return status;
        }
        copyText(command.body(), text);
        return nullptr;
    });
}

IZELServerStatus* CheckedCommand::upload(const IZELServerString& path, IZELServerProgressListener* progress)
{
    // The channel opens the file before it sends anything, so a file that cannot be read is
    // reported (393623 with the path) while the connection is still in step.
    const std::string localPath = toStdString(path);
    return run([&localPath, progress](Command& command) { return command.transfer(localPath, kUpload, progress); });
}

IZELServerStatus* CheckedCommand::download(const DownloadTarget& target, unsigned& received,
                                           IZELServerProgressListener* progress)
{
    return run(received, [&](Command& command) { return command.receive(target, received, progress); });
}

}  // namespace zel
