#pragma once
// The one place where zelctl meets a session: it creates the session, signs in, owns every string
// it hands out and turns a status into a failure value that main prints as the error line.

#include <zelserverapi/ZELServerOwned.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace zelctl {

// zelctl's exit statuses; docs/zelctl.md lists them.
enum Exit : int {
    kExitSuccess = 0,
    kExitError = 1,
    kExitUsage = 2,
    kExitJobFailed = 3,
    kExitJobAborted = 4,
    kExitTimedOut = 5,
};

// A failure to report: the status's message number (0 for the client's own complaints), its text
// (nothing is printed when it is empty) and the exit status it ends zelctl with.
struct Failure {
    unsigned number = 0;
    std::string text;
    int exit = kExitError;
};
using Outcome = std::optional<Failure>;

struct GlobalOptions {
    std::string host = "127.0.0.1";
    unsigned short port = 7071;
    std::string user;
    std::string password;
    std::string token;
    std::string clientId;
    // Seconds for connecting and for each exchange; 0 waits as long as the system lets it.
    unsigned timeout = 0;
    bool json = false;
    bool quiet = false;
};

class Connection {
public:
    explicit Connection(const GlobalOptions& options);
    ~Connection();
    Connection(const Connection&) = delete;
    Connection& operator=(const Connection&) = delete;

    // Creates the session and signs in with a token when one is given, with user and password otherwise.
    Outcome open();
    // Connects and runs the handshake without credentials: nothing when a server answered it.
    Outcome reach();

    IZELServerSession& session() { return *session_; }
    const GlobalOptions& options() const { return options_; }

    // Owns an object the session made (null stays null).
    template <typename T>
    ZELServerOwned<T> own(T* object)
    {
        return zelServerOwn(*session_, object);
    }

    // A string owned by the connection, released before the session goes.
    IZELServerString& text(const std::string& value = "");

    // Nothing for success; the status's number and text otherwise. The status is released either way.
    Outcome check(IZELServerStatus* status);

    // Reads a value through one of the interface's `get...(IZELServerString&)` calls.
    template <typename Getter>
    std::string read(Getter getter)
    {
        IZELServerString& out = text();
        getter(out);
        return out.c_str();
    }
    // The same through a getter of `object`: read(service, &IZELServerService::getName).
    template <typename Object, typename Getter>
    std::string read(const Object& object, Getter getter)
    {
        return read([&](IZELServerString& out) { (object.*getter)(out); });
    }

private:
    // Connects and runs the handshake, signed in or with empty credentials.
    Outcome start(bool signIn);
    Failure describe(const IZELServerStatus& status) const;

    GlobalOptions options_;
    // Declared in the order they are made: the strings go first, the session last.
    ZELServerOwned<IZELServerSession> session_;
    ZELServerOwned<IZELServerConnectionInfo> made_;
    std::unique_ptr<IZELServerConnectionInfo> withTimeouts_;
    std::vector<ZELServerOwned<IZELServerString>> strings_;
};

// "1 second", "5 seconds".
inline std::string secondsText(unsigned seconds)
{
    return std::to_string(seconds) + (seconds == 1 ? " second" : " seconds");
}

// The parts of NAME=VALUE; nullopt when there is no "=" or the name is empty.
std::optional<std::pair<std::string, std::string>> splitPair(const std::string& text);

}  // namespace zelctl
