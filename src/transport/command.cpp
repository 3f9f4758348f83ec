#include "transport/command.h"

#include <filesystem>
#include <optional>
#include <system_error>
#include <utility>

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

IZELServerStatus* receiveIntoTemporary(IZELServerChannel& channel, IZELServerRequest& request,
                                       IZELServerResponse& response, const std::string& destination,
                                       IZELServerProgressListener* progress, std::optional<TemporaryFile>& temporary,
                                       std::uint64_t& arrived)
{
    arrived = kNoFileArrived;
    // A folder could never be replaced by the file; found out before anything is sent.
    std::error_code ignored;
    if (!std::filesystem::is_directory(destination, ignored)) {
        if (std::optional<TemporaryFile> made = TemporaryFile::createBeside(destination)) {
            temporary.emplace(std::move(*made));
        }
    }
    if (!temporary) {
        return makeStatus(msg::kLocalFileWrite,
                          destination.empty() ? TemporaryFile::directoryFor(destination) : destination);
    }
    // Declared after the temporary file, so it is closed before that file can be deleted.
    LocalFile file(temporary->path(), temporary->takeWriter());
    if (IZELServerStatus* status = channel.exchange(request, response, nullptr, &file, progress)) {
        return status;
    }
    // The channel closes the file once the announced content is in: one still open got nothing.
    if (!file.isOpen()) {
        arrived = file.written();
    }
    return nullptr;
}

IZELServerStatus* Command::receive(const DownloadTarget& target, unsigned& received,
                                   IZELServerProgressListener* progress)
{
    if (!ready()) {
        return notReady();
    }
    std::optional<TemporaryFile> temporary;
    std::uint64_t arrived = kNoFileArrived;
    if (IZELServerStatus* status =
            receiveIntoTemporary(channel_, *request_, *response_, target.destination, progress, temporary, arrived)) {
        return status;
    }
    if (arrived == kNoFileArrived || (target.emptyIsMissing && arrived == 0)) {
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
