// A server that hangs up in the middle of its answer. For each kind of exchange the connection is
// closed after every possible number of answer bytes: the call must come back with a status, an
// existing destination file must stay as it was, and the session must work again after a new init.

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include <zelserverapi/interfaces.h>
#include <zelserverapi/zelserverapi.h>

#include "support/environment.h"
#include "support/fake_server.h"
#include "support/helpers.h"

namespace zeltest {
namespace {

// One step of the server's side: read a frame, read raw bytes, or write bytes as they are.
struct Step {
    enum { Read, ReadRaw, Write } kind;
    Bytes bytes = {};
    std::size_t count = 0;
};

Step readFrame() { return {Step::Read}; }
Step readRaw(std::size_t count) { return {Step::ReadRaw, {}, count}; }
Step answer(const Bytes& payload) { return {Step::Write, frame(payload)}; }

const Bytes kSignedIn = reply("SUCCESS", R"(<S><IDENTITY id="ann" is_authenticated="true"/></S>)");
const std::string kContent = "zlw-bytes";

// The session a case runs on; what it makes is released with it.
class Client {
public:
    Client() { ZEL_createServerSession(&session); }
    ~Client()
    {
        session->destroyRepository(&repository);
        session->destroyConnectionInfo(&info);
        for (IZELServerString* s : strings) {
            session->destroyString(&s);
        }
        ZEL_destroyServerSession(&session);
    }
    IZELServerString& text(const std::string& value)
    {
        strings.push_back(session->createString());
        strings.back()->assign(value.c_str());
        return *strings.back();
    }
    // The number of a status, which is released; 0 for none.
    unsigned take(IZELServerStatus* status)
    {
        const unsigned number = status ? status->getMessageNumber() : 0;
        session->destroyStatus(&status);
        return number;
    }
    unsigned init(std::uint16_t port)
    {
        session->destroyConnectionInfo(&info);
        info = session->createConnectionInfo(text("127.0.0.1"), port, text("ann"), text("pw"));
        return take(session->init(*info, nullptr));
    }
    unsigned exists()
    {
        unsigned found = 0;
        const unsigned number = take(session->getRepositoryManager()->repositoryExists(text("R"), found));
        return number == 0 && found == 1 ? 0 : number == 0 ? 1 : number;
    }

    IZELServerSession* session = nullptr;
    IZELServerConnectionInfo* info = nullptr;
    IZELServerRepository* repository = nullptr;
    std::vector<IZELServerString*> strings;
};

struct Kind {
    const char* name;
    std::vector<Step> before;                                          // the full exchanges that come first
    std::vector<Step> cut;                                             // the exchange whose answer is cut
    std::function<unsigned(Client&, const std::string& folder)> call;  // the status number
};

const std::vector<Step> kSignIn = {readFrame(), answer(kSignedIn)};
const std::vector<Step> kRepository = {readFrame(), answer(kSignedIn), readFrame(),
                                       answer(reply("SUCCESS", R"(<R><REPOSITORY name="R"/></R>)"))};

// Every download answers the same way: the file header, the content, and the final "true".
const std::vector<Step> kDownloadCut = {readFrame(), answer(fileHeader(kContent.size(), crc32(kContent))),
                                        readFrame(), {Step::Write, kContent},
                                        readFrame(), answer(reply("SUCCESS", "true"))};

unsigned withRepository(Client& client, const std::function<IZELServerStatus*(IZELServerRepository&)>& call)
{
    client.repository = client.session->createRepository();
    unsigned found = 0;
    const unsigned number =
        client.take(client.session->getRepositoryManager()->getRepository(client.text("R"), *client.repository, found));
    return number != 0 || found != 1 ? 1 : client.take(call(*client.repository));
}

const Kind kKinds[] = {
    {"sign-in", {}, kSignIn, [](Client&, const std::string&) { return 0u; }},
    {"plain",
     kSignIn,
     {readFrame(), answer(reply("SUCCESS", "true"))},
     [](Client& c, const std::string&) {
         unsigned found = 0;
         return c.take(c.session->getRepositoryManager()->repositoryExists(c.text("R"), found));
     }},
    {"list",
     kSignIn,
     {readFrame(), answer(reply("SUCCESS", R"(<R><REPOSITORY name="A"/></R>)"))},
     [](Client& c, const std::string&) {
         IZELServerVector<IZELServerRepository>* all = c.session->createRepositoryVector();
         const unsigned number = c.take(c.session->getRepositoryManager()->getRepositories(nullptr, *all));
         c.session->destroyRepositoryVector(&all);
         return number;
     }},
    {"upload",
     kRepository,
     {readFrame(), answer(readyAck()), readFrame(), answer(readyAck()), readRaw(kContent.size()),
      answer(reply("SUCCESS", "true"))},
     [](Client& c, const std::string& folder) {
         const std::string source = folder + "/up.zlw";
         spew(source, kContent);
         return withRepository(c, [&](IZELServerRepository& r) { return r.addItem(c.text("a.zlw"), c.text(source)); });
     }},
    {"download", kRepository, kDownloadCut,
     [](Client& c, const std::string& folder) {
         unsigned received = 0;
         return withRepository(c, [&](IZELServerRepository& r) {
             return r.getItem(c.text("a.zlw"), c.text(folder + "/kept"), received);
         });
     }},
    {"item resource", kRepository, kDownloadCut,
     [](Client& c, const std::string& folder) {
         unsigned received = 0;
         return withRepository(c, [&](IZELServerRepository& r) {
             return r.getItemResource(c.text("a.zlw"), c.text("notes.txt"), c.text(folder + "/kept"), received);
         });
     }},
    {"job log", kSignIn, kDownloadCut,
     [](Client& c, const std::string& folder) {
         unsigned success = 0;
         return c.take(c.session->getTransformationManager()->getLogFile(7, c.text(folder + "/kept"), success));
     }},
    // Only the answer on the command's own connection: after all of it the library waits for the
    // server's call on the result port, which no hang-up ends.
    {"result port",
     kSignIn,
     {readFrame(), answer(reply("SUCCESS", "queued"))},
     [](Client& c, const std::string&) {
         IZELServerStringArray* none = c.session->createStringArray();
         IZELServerString& result = c.text("");
         const unsigned number = c.take(
             c.session->getTransformationManager()->transactJobString(c.text("svc"), c.text("r"), *none, result));
         c.session->destroyStringArray(&none);
         return number;
     }},
};

// The script of one case: the exchanges before, the cut one up to `offset` answer bytes, then the
// hang-up, and a second connection for the new sign-in and one plain command.
void script(FakeServer& server, const Kind& kind, std::size_t offset)
{
    for (const Step& step : kind.before) {
        step.kind == Step::Read ? server.expectAnyFrame() : server.sendRaw(step.bytes);
    }
    for (const Step& step : kind.cut) {
        if (step.kind == Step::Read) {
            server.expectAnyFrame();
        } else if (step.kind == Step::ReadRaw) {
            server.expectRaw(step.count);
        } else if (offset < step.bytes.size()) {
            server.sendRaw(step.bytes.substr(0, offset));
            break;
        } else {
            server.sendRaw(step.bytes);
            offset -= step.bytes.size();
        }
    }
    server.closeConnection().acceptNext().expectAnyFrame().sendFrame(kSignedIn).expectAnyFrame().sendFrame(
        reply("SUCCESS", "true"));
}

std::size_t answerBytes(const Kind& kind)
{
    std::size_t total = 0;
    for (const Step& step : kind.cut) {
        total += step.kind == Step::Write ? step.bytes.size() : 0;
    }
    return total;
}

TEST(CutConnection, EveryCallReturnsAStatusKeepsTheDestinationAndTheSessionSignsInAgain)
{
    for (const Kind& kind : kKinds) {
        for (std::size_t offset = 0; offset < answerBytes(kind); ++offset) {
            SCOPED_TRACE(std::string(kind.name) + ", hang-up after " + std::to_string(offset) + " bytes");
            const TempDir folder("zel-cut");
            spew(folder.path() / "kept", "old contents");
            FakeServer server;
            script(server, kind, offset);
            server.start();
            Client client;
            const bool signIn = std::string(kind.name) == "sign-in";
            const unsigned first = client.init(server.port());
            const unsigned cut = signIn ? first : first == 0 ? kind.call(client, folder.string()) : 1;
            const bool held = cut != 0 && slurp(folder.path() / "kept") == "old contents" &&
                              client.init(server.port()) == 0 && client.exists() == 0;
            EXPECT_TRUE(held) << "status " << cut << ", file \"" << slurp(folder.path() / "kept") << "\"";
            server.finish();
            if (!held) {
                break;  // one report per kind
            }
        }
    }
}

}  // namespace
}  // namespace zeltest
