#pragma once
// Wire tests of the managers on a channel signed in to the fake server as "ann". SignedInChannelTest
// scripts the handshake in SetUp, so a test scripts only its own commands and then calls signIn().
// WireTableTest runs a table of rows, each one call: the command bytes it must send with the server's
// answer (no command: the call must send nothing at all), then the status number and the out values
// the call must leave. One body runs a whole table in order on one connection, so a row also shows
// that the session stays usable after the rows before it.

#include <filesystem>
#include <functional>
#include <memory>
#include <ostream>
#include <string>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>
#include <zelserverapi/IZELServerVector.h>

#include "api/ZELServerString.h"
#include "session/ZELServerConnectionInfo.h"
#include "support/environment.h"
#include "support/fake_server.h"
#include "support/helpers.h"
#include "transport/ZELServerTCPIPChannel.h"

namespace zeltest {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

class SignedInChannelTest : public ::testing::Test {
protected:
    static inline const Bytes kHandshake =
        request("SERVER_SESSION_INIT", {{"clientID", ""}, {"userID", "ann"}, {"userPassword", "pw1"}});
    static inline const Bytes kSignedIn =
        reply("SUCCESS", R"(<SESSION><IDENTITY id="ann" is_authenticated="true"/></SESSION>)");

    void SetUp() override { server.exchange(kHandshake, kSignedIn); }

    // Starts the script and signs in; every step of the test must be scripted before.
    void signIn()
    {
        server.start();
        const zel::ZELServerConnectionInfo info(zel::ZELServerString("127.0.0.1"), server.port(),
                                                zel::ZELServerString("ann"), zel::ZELServerString("pw1"));
        const StatusPtr status(channel->open(info, nullptr));
        ASSERT_EQ(status, nullptr) << describe(status.get());
    }

    // A command of the signed-in session: the identity document named after the keyword, the empty
    // client identifier, then the command's own values.
    static Bytes command(const std::string& keyword, const Values& values = {})
    {
        Values all{{"identityObject",
                    xmlDocument(keyword, R"(<IDENTITY id="ann" is_authenticated="true"><ROLES/></IDENTITY>)")},
                   {"clientID", ""}};
        all.insert(all.end(), values.begin(), values.end());
        return request(keyword, all);
    }

    // A payload document as the library writes it: declaration, then a root element named after
    // the command around `content`.
    static std::string xmlDocument(const std::string& root, const std::string& content)
    {
        return R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?><)" + root + ">" + content + "</" + root + ">";
    }

    // A file in the test's own folder; its path.
    std::string file(const std::string& name, const std::string& content) const
    {
        spew(dir / name, content);
        return (dir / name).string();
    }

    FakeServer server;
    std::unique_ptr<zel::ZELServerTCPIPChannel> channel{new zel::ZELServerTCPIPChannel()};
    const TempDir scratch{"zel-wire"};
    const std::filesystem::path dir{scratch.path()};
};

// What a call left: its status number (0 for none) and its out values, each followed by a space.
struct Outcome {
    unsigned number = 0;
    std::string outs;
    bool operator==(const Outcome&) const = default;
};

inline std::ostream& operator<<(std::ostream& out, const Outcome& outcome)
{
    return out << outcome.number << " [" << outcome.outs << "]";
}

// The texts of `count` things, each followed by a comma.
template <class Text>
std::string joined(std::size_t count, const Text& textOf)
{
    std::string all;
    for (std::size_t i = 0; i < count; ++i) {
        all += textOf(i) + ",";
    }
    return all;
}

inline std::string outText(unsigned value) { return std::to_string(value); }
inline std::string outText(const std::string& value) { return value; }
inline std::string outText(const IZELServerString& value) { return std::string(value.data(), value.length()); }
// The names of the objects of a list the call filled.
template <class I>
std::string outText(IZELServerVector<I>& vector)
{
    return joined(vector.entries(), [&](std::size_t i) {
        zel::ZELServerString name;
        vector.element(static_cast<unsigned>(i))->getName(name);
        return name.str();
    });
}
// The progress calls in order.
inline std::string outText(const ProgressLog& progress)
{
    return joined(progress.calls.size(), [&](std::size_t i) { return progress.calls[i]; });
}
// A reader of something the call filled, run after the call.
template <class Read>
    requires std::is_invocable_r_v<std::string, const Read&>
std::string outText(const Read& read)
{
    return read();
}

// Takes the status; the out values are read after the call, as they are bound by reference (so pass
// the objects the call fills, or readers of them, never values computed from them).
template <class... Outs>
Outcome outcome(IZELServerStatus* raw, Outs&&... outs)
{
    const StatusPtr status(raw);
    Outcome result{status ? status->getMessageNumber() : 0, {}};
    ((result.outs += outText(outs) + " "), ...);
    return result;
}

// The steps after the command of an upload: the file header, the raw content, then `answer`.
inline std::function<void(FakeServer&)> uploadOf(const std::string& content, const Bytes& answer)
{
    return [=](FakeServer& server) {
        server.exchange(fileHeader(content.size(), crc32(content)), readyAck()).expectRaw(content).sendFrame(answer);
    };
}

// The steps after the file header of a download: the content after the client's go-ahead, then
// `answer` after the second.
inline std::function<void(FakeServer&)> downloadOf(const std::string& content, const Bytes& answer)
{
    return [=](FakeServer& server) { server.expectFrame(readyAck()).sendRaw(content).exchange(readyAck(), answer); };
}

struct WireRow {
    const char* what;
    Bytes request;  // empty (and no `then`): nothing may be sent
    Bytes answer;
    std::function<Outcome()> call;
    unsigned number;
    std::string outs;
    // Steps after the answer (file transfers), or the whole script of a row without a request.
    std::function<void(FakeServer&)> then = {};
};

class WireTableTest : public SignedInChannelTest {
protected:
    // Request and answer of a row that must send nothing.
    static inline const Bytes none{};

    // The out flag of a call, set to 7 first so that a call that leaves it alone shows.
    unsigned& fresh()
    {
        flag = 7;
        return flag;
    }
    unsigned flag = 7;

    void run(const std::vector<WireRow>& rows)
    {
        for (const WireRow& row : rows) {
            if (!row.request.empty()) {
                server.exchange(row.request, row.answer);
            }
            if (row.then) {
                row.then(server);
            }
        }
        signIn();
        for (const WireRow& row : rows) {
            EXPECT_EQ(row.call(), (Outcome{row.number, row.outs})) << row.what;
        }
        EXPECT_TRUE(server.verify());
    }
};

}  // namespace zeltest
