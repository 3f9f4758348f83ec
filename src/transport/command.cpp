#include "transport/command.h"

#include <filesystem>
#include <optional>
#include <system_error>

#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/LocalFile.h"
#include "transport/temporary_file.h"

namespace zel {

Command::Command(IZELServerChannel& channel, const std::string& keyword)
    : channel_(channel), request_(channel.createRequest(keyword)), response_(channel.createResponse())
{}

Command::Command(IZELServerChannel& channel, const std::string& keyword, const IZELServerStringArray& directives,
                 const IZELServerStringArray& notifications)
    : channel_(channel),
      request_(channel.createRequest(keyword, directives, notifications)),
      response_(channel.createResponse())
{}

Command::~Command()
{
    // The channel made both, so only the channel may release them.
    if (request_ != nullptr) {
        channel_.destroyRequest(request_);
    }
    if (response_ != nullptr) {
        channel_.destroyResponse(response_);
    }
}

Command& Command::add(const std::string& name, const std::string& value)
{
    if (ready()) {
        request_->addValue(name, value);
    }
    return *this;
}

Command& Command::add(const std::string& name, const IZELServerString& value)
{
    if (ready()) {
        request_->addValue(name, value);
    }
    return *this;
}

Command& Command::addBoolean(const std::string& name, unsigned flag)
{
    if (ready()) {
        request_->addBooleanValue(name, flag);
    }
    return *this;
}

Command& Command::addList(const std::string& name, const IZELServerStringArray& pairs)
{
    if (ready()) {
        request_->addValueList(name, pairs);
    }
    return *this;
}

IZELServerStatus* Command::send(unsigned requestType)
{
    if (!ready()) {
        return notReady();
    }
    return channel_.sendRequest(*request_, *response_, requestType);
}

IZELServerStatus* Command::transfer(const std::string& localPath, unsigned direction,
                                    IZELServerProgressListener* progress)
{
    if (!ready()) {
        return notReady();
    }
    return channel_.transferFile(*request_, *response_, localPath, direction, progress);
}

IZELServerStatus* Command::receive(const DownloadTarget& target, unsigned& received,
                                   IZELServerProgressListener* progress)
{
    if (!ready()) {
        return notReady();
    }
    // A folder could never be replaced by the file; found out before anything is sent.
    std::error_code ignored;
    std::optional<TemporaryFile> temporary = std::filesystem::is_directory(target.destination, ignored)
                                                 ? std::nullopt
                                                 : TemporaryFile::createBeside(target.destination);
    if (!temporary) {
        const std::string& named = target.destination;
        return makeStatus(msg::kLocalFileWrite, named.empty() ? TemporaryFile::directoryFor(named) : named);
    }
    // Declared after the temporary file, so it is closed before that file is deleted.
    LocalFile file(temporary->path(), temporary->takeWriter());
    if (IZELServerStatus* status = channel_.exchange(*request_, *response_, nullptr, &file, progress)) {
        return status;
    }
    // The channel closes the file once the announced content is in: one still open got nothing.
    if (file.isOpen() || (target.emptyIsMissing && file.written() == 0)) {
        return makeStatus(msg::kEmptyDownload, target.source);
    }
    const std::string answer = body();
    if (answer != "true") {
        if (answer != "false") {
            return makeStatus(msg::kUnexpectedReply, answer);
        }
        received = 0;
        return nullptr;
    }
    if (target.destination.empty()) {
        temporary->keep();
    } else if (!temporary->moveTo(target.destination)) {
        return makeStatus(msg::kLocalFileWrite, target.destination);
    }
    received = 1;
    return nullptr;
}

std::string Command::body() const
{
    std::string text;
    if (response_ != nullptr) {
        response_->getBody(text);
    }
    return text;
}

// Only reachable when the heap's failure routine returned instead of ending the process; the command
// must then fail without sending half a request.
IZELServerStatus* Command::notReady() const
{
    return makeStatus(msg::kServerError, std::string("Not enough memory to build the request."));
}

}  // namespace zel
