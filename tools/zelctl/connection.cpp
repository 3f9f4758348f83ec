#include "connection.h"

#include <utility>

namespace zelctl {

namespace {

// What the library reports: the connect failure's number, the handshake answers that prove a server
// is there, and the socket codes it gives as a status's secondary code.
constexpr unsigned kConnectFailed = 393601;
constexpr unsigned kServerError = 393625;
constexpr unsigned kSignInRefused = 393631;
constexpr unsigned kHostUnknown = 392005;
constexpr unsigned kConnectRefused = 392006;
constexpr unsigned kSocketTimedOut = 392012;

// The session's connection information with the time-out properties added. The library reads every
// property through this interface, so wrapping the one it made is how a password sign-in carries them.
class WithTimeouts final : public IZELServerConnectionInfo {
public:
    WithTimeouts(const IZELServerConnectionInfo& made, unsigned seconds)
        : made_(made), seconds_(std::to_string(seconds))
    {}

    void getHost(IZELServerString& out) const override { made_.getHost(out); }
    unsigned short getPort() const override { return made_.getPort(); }
    void getUserName(IZELServerString& out) const override { made_.getUserName(out); }
    void getPassword(IZELServerString& out) const override { made_.getPassword(out); }
    unsigned getConnectionKind() const override { return made_.getConnectionKind(); }
    void getAddress(IZELServerString& out) const override { made_.getAddress(out); }
    void getAuxiliaryText(IZELServerString& out) const override { made_.getAuxiliaryText(out); }
    unsigned getAuthenticationKind() const override { return made_.getAuthenticationKind(); }

    bool getProperty(const IZELServerString& key, IZELServerString& out) const override
    {
        for (const char* name : {"CONNECT_TIMEOUT", "IO_TIMEOUT", "RESULT_PORT_TIMEOUT"}) {
            if (key.equals(name)) {
                out.set(seconds_.data(), static_cast<unsigned>(seconds_.size()));
                return true;
            }
        }
        return made_.getProperty(key, out);
    }

private:
    const IZELServerConnectionInfo& made_;
    std::string seconds_;
};

}  // namespace

Connection::Connection(const GlobalOptions& options) : options_(options), session_(zelServerCreateSession()) {}

// The server is told that we leave before the session goes.
Connection::~Connection()
{
    if (made_)
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
    return describe(*owned);
}

// The status's number stays; where its socket code tells what went wrong, the text says so.
Failure Connection::describe(const IZELServerStatus& status) const
{
    const Failure failure{status.getMessageNumber(), status.getMessage() ? status.getMessage() : ""};
    const std::string where = options_.host + ":" + std::to_string(options_.port);
    if (status.getCode() == kSocketTimedOut)
        return {failure.number, "timed out after " + secondsText(options_.timeout) + " waiting for " + where,
                kExitTimedOut};
    if (failure.number != kConnectFailed)
        return failure;
    if (status.getCode() == kHostUnknown)
        return {failure.number, "host not found: " + options_.host};
    if (status.getCode() == kConnectRefused)
        return {failure.number, "connection refused by " + where};
    return failure;
}

Outcome Connection::start(bool signIn)
{
    if (!session_)
        return Failure{0, "the client library could not create a session"};
    if (signIn && !options_.token.empty()) {
        const ZELServerOwned<IZELServerStringArray> properties = own(session_->createStringArray());
        properties->append("USER_TOKEN");
        properties->append(options_.token.c_str());
        made_ = own(session_->createConnectionInfo(text(options_.host), options_.port, *properties));
    } else {
        made_ =
            own(session_->createConnectionInfo(text(options_.host), options_.port, text(signIn ? options_.user : ""),
                                               text(signIn ? options_.password : "")));
    }
    if (!made_)
        return Failure{0, "the client library could not create the connection information"};
    if (options_.timeout != 0)
        withTimeouts_ = std::make_unique<WithTimeouts>(*made_, options_.timeout);
    // The client ID travels with the handshake, whichever way the user signs in.
    ZELServerOwned<IZELServerStringArray> handshake;
    if (!options_.clientId.empty()) {
        handshake = own(session_->createStringArray());
        handshake->append("CLIENT_ID");
        handshake->append(options_.clientId.c_str());
    }
    return check(session_->init(withTimeouts_ ? *withTimeouts_ : *made_, handshake.get()));
}

Outcome Connection::open()
{
    // Without a user name the server would only say "invalid user name or password".
    if (options_.token.empty() && options_.user.empty())
        return Failure{0, "no user given: use --user or ZEL_USER, or --token or ZEL_TOKEN", kExitUsage};
    return start(true);
}

Outcome Connection::reach()
{
    Outcome outcome = start(false);
    // A refused sign-in is the server's own answer: it is up.
    if (outcome && (outcome->number == kServerError || outcome->number == kSignInRefused))
        return std::nullopt;
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
