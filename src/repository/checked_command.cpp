#include "repository/checked_command.h"

#include <string_view>
#include <utility>

#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "api/status.h"

namespace zel {

bool isAllowedName(const IZELServerString& name)
{
    return toStdString(name).find_first_of(kForbiddenNameCharacters) == std::string::npos;
}

std::string enableFilterFor(const ZELServerStringDict& directives)
{
    const std::string* filter = directives.find("ENABLE_FILTER");
    if (filter == nullptr) {
        return {};
    }
    if (*filter == "ALL") {
        return "All";
    }
    if (*filter == "ENABLED") {
        return "Enabled";
    }
    if (*filter == "DISABLED") {
        return "Disabled";
    }
    return {};
}

ZELServerStringArray enableFilterList(const ZELServerStringDict* directives)
{
    ZELServerStringArray pairs({"enableFilter"});
    const std::string filter = directives == nullptr ? "All" : enableFilterFor(*directives);
    if (!filter.empty()) {
        pairs.append(filter);
    }
    return pairs;
}

CheckedCommand::CheckedCommand(IZELServerChannel* channel, std::string keyword)
    : channel_(channel), keyword_(std::move(keyword))
{}

CheckedCommand& CheckedCommand::fail(unsigned number, std::string parameter)
{
    if (failure_ == 0) {
        failure_ = number;
        failureParameter_ = std::move(parameter);
    }
    return *this;
}

CheckedCommand& CheckedCommand::require(const IZELServerString& text) { return require(text.length() > 0); }

CheckedCommand& CheckedCommand::require(bool condition) { return check(condition, msg::kRequiredValueMissing); }

CheckedCommand& CheckedCommand::allowedName(const IZELServerString& name)
{
    return isAllowedName(name) ? *this : fail(msg::kForbiddenCharacter, kForbiddenNameCharacters);
}

CheckedCommand& CheckedCommand::distinct(const IZELServerString& resourceName, const IZELServerString& itemName)
{
    return check(toStdString(resourceName) != toStdString(itemName), msg::kResourceNamedAsItem);
}

CheckedCommand& CheckedCommand::check(bool condition, unsigned number) { return condition ? *this : fail(number); }

CheckedCommand& CheckedCommand::add(const std::string& name, const std::string& value)
{
    values_.push_back([name, value](Command& command) { command.add(name, value); });
    return *this;
}

CheckedCommand& CheckedCommand::add(const std::string& name, const IZELServerString& value)
{
    return add(name, toStdString(value));
}

CheckedCommand& CheckedCommand::addList(const std::string& name, const ZELServerStringArray& pairs)
{
    values_.push_back([name, pairs](Command& command) { command.addList(name, pairs); });
    return *this;
}

CheckedCommand& CheckedCommand::addXml(const std::string& name, const XmlWritable& object, const std::string& rootName)
{
    values_.push_back(
        [name, &object, rootName](Command& command) { command.request().addXmlValue(name, object, rootName); });
    return *this;
}

CheckedCommand& CheckedCommand::addService(const std::string& name, const IZELServerService& service)
{
    values_.push_back([name, &service](Command& command) { command.request().addServicePayload(name, service); });
    return *this;
}

CheckedCommand& CheckedCommand::addRepository(const std::string& name, const IZELServerString& repositoryName,
                                              const IZELServerString& description)
{
    values_.push_back([name, &repositoryName, &description](Command& command) {
        command.request().addRepositoryPayload(name, repositoryName, description);
    });
    return *this;
}

IZELServerStatus* CheckedCommand::run(const Exchange& exchange)
{
    if (failure_ != 0) {
        return failureParameter_.empty() ? makeStatus(failure_) : makeStatus(failure_, failureParameter_);
    }
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, keyword_);
    // A command without its request (memory exhausted) takes no values; its send reports that.
    if (command.ready()) {
        for (const Value& value : values_) {
            value(command);
        }
    }
    return exchange(command);
}

IZELServerStatus* CheckedCommand::send()
{
    return run([](Command& command) { return command.send(); });
}

IZELServerStatus* CheckedCommand::askFlag(unsigned& flag)
{
    flag = 0;
    return run([&flag](Command& command) -> IZELServerStatus* {
        if (IZELServerStatus* status = command.send()) {
            return status;
        }
        // A body that is no truth value leaves the flag at 0; the exchange itself went through.
        command.response().readBoolean(flag);
        return nullptr;
    });
}

IZELServerStatus* CheckedCommand::askObject(unsigned& found, const Reader& read)
{
    found = 0;
    return run([&found, &read](Command& command) -> IZELServerStatus* {
        if (IZELServerStatus* status = command.send()) {
            return status;
        }
        found = read(command.response()) == 0 ? 1 : 0;
        return nullptr;
    });
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

IZELServerStatus* CheckedCommand::upload(const IZELServerString& path, IZELServerProgressListener* progress)
{
    // The channel opens the file before it sends anything, so a file that cannot be read is
    // reported (393623 with the path) while the connection is still in step.
    const std::string localPath = toStdString(path);
    return run([&localPath, progress](Command& command) { return command.transfer(localPath, kUpload, progress); });
}

}  // namespace zel
