#include "connection.h"

namespace zelctl {

Connection::Connection(const GlobalOptions& options) : options_(options), session_(zelServerCreateSession()) {}

// The server is told that we leave before the session goes.
Connection::~Connection()
{
    if (info_)
        own(session_->disconnect());
}

IZELServerString& Connection::text(const std::string& value)
{
    strings_.push_back(own(session_->createString()));
    strings_.back()->set(value.data(), static_cast<unsigned>(value.size()));
    return *strings_.back();
}

Outcome Connection::check(IZELServerStatus* status)
{
    const ZELServerOwned<IZELServerStatus> owned = own(status);
    if (!owned)
        return std::nullopt;
    return Failure{owned->getMessageNumber(), owned->getMessage() ? owned->getMessage() : ""};
}

Outcome Connection::open()
{
    if (!session_)
        return Failure{0, "the client library could not create a session"};
    if (!options_.token.empty()) {
        const ZELServerOwned<IZELServerStringArray> properties = own(session_->createStringArray());
        properties->append("USER_TOKEN");
        properties->append(options_.token.c_str());
        info_ = own(session_->createConnectionInfo(text(options_.host), options_.port, *properties));
    } else {
        info_ = own(session_->createConnectionInfo(text(options_.host), options_.port, text(options_.user),
                                                   text(options_.password)));
    }
    if (!info_)
        return Failure{0, "the client library could not create the connection information"};
    // The client ID travels with the handshake, whichever way the user signs in.
    ZELServerOwned<IZELServerStringArray> handshake;
    if (!options_.clientId.empty()) {
        handshake = own(session_->createStringArray());
        handshake->append("CLIENT_ID");
        handshake->append(options_.clientId.c_str());
    }
    return check(session_->init(*info_, handshake.get()));
}

std::optional<std::pair<std::string, std::string>> splitPair(const std::string& text)
{
    const auto equals = text.find('=');
    if (equals == std::string::npos || equals == 0)
        return std::nullopt;
    return std::make_pair(text.substr(0, equals), text.substr(equals + 1));
}

}  // namespace zelctl
