#include "transport/command.h"

#include "api/message_numbers.h"
#include "api/status.h"

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

IZELServerStatus* Command::receive(const std::string& localPath, unsigned& received,
                                   IZELServerProgressListener* progress)
{
    if (IZELServerStatus* status = transfer(localPath, kDownload, progress)) {
        return status;
    }
    response_->readBoolean(received);
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
