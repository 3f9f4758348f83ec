#include "connection.h"

namespace zelctl {

Connection::Connection(const GlobalOptions& options) : options_(options) { ZEL_createServerSession(&session_); }

Connection::~Connection()
{
    strings_.clear();
    if (session_ != nullptr) {
        if (info_ != nullptr) {
            IZELServerStatus* status = session_->disconnect();
            session_->destroyStatus(&status);
            session_->destroyConnectionInfo(&info_);
        }
        ZEL_destroyServerSession(&session_);
    }
}

IZELServerString& Connection::text(const std::string& value)
{
    strings_.emplace_back(session_->createString(), StringReleaser{session_});
    strings_.back()->set(value.data(), static_cast<unsigned>(value.size()));
    return *strings_.back();
}

Outcome Connection::check(IZELServerStatus* status)
{
    if (status == nullptr)
        return std::nullopt;
    Failure failure{status->getMessageNumber(), status->getMessage() ? status->getMessage() : ""};
    session_->destroyStatus(&status);
    return failure;
}

Outcome Connection::open()
{
    if (session_ == nullptr)
        return Failure{0, "the client library could not create a session"};
    if (!options_.token.empty()) {
        IZELServerStringArray* properties = session_->createStringArray();
        properties->append("USER_TOKEN");
        properties->append(options_.token.c_str());
        info_ = session_->createConnectionInfo(text(options_.host), options_.port, *properties);
        session_->destroyStringArray(&properties);
    } else {
        info_ = session_->createConnectionInfo(text(options_.host), options_.port, text(options_.user),
                                               text(options_.password));
    }
    if (info_ == nullptr)
        return Failure{0, "the client library could not create the connection information"};
    // The client ID travels with the handshake, whichever way the user signs in.
    IZELServerStringArray* handshake = nullptr;
    if (!options_.clientId.empty()) {
        handshake = session_->createStringArray();
        handshake->append("CLIENT_ID");
        handshake->append(options_.clientId.c_str());
    }
    Outcome outcome = check(session_->init(*info_, handshake));
    if (handshake != nullptr)
        session_->destroyStringArray(&handshake);
    return outcome;
}

std::optional<std::pair<std::string, std::string>> splitPair(const std::string& text)
{
    const auto equals = text.find('=');
    if (equals == std::string::npos || equals == 0)
        return std::nullopt;
    return std::make_pair(text.substr(0, equals), text.substr(equals + 1));
}

}  // namespace zelctl
