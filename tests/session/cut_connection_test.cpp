// A server that hangs up in the middle of its answer. For each kind of exchange the connection is
// closed after every possible number of answer bytes: the call must come back with a status, an
// existing destination file must stay as it was, and the session must work again after a new init.

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hostile_fixture.h"
#include "support/environment.h"

namespace zeltest {
namespace {

// One step of the server's side: read a frame, read raw bytes, or write bytes as they are.
struct Step {
    enum { Read, ReadRaw, Write } kind;
    Bytes bytes = {};
};

Step readFrame() { return {Step::Read}; }
Step answer(const Bytes& payload) { return {Step::Write, frame(payload)}; }

const std::string kContent = "zlw-bytes";

IZELServerStatus* repositoryExists(IZELServerSession& s, const std::string&, unsigned& found)
{
    Texts t(s);
    return s.getRepositoryManager()->repositoryExists(t("R"), found);
}

IZELServerStatus* listRepositories(IZELServerSession& s, const std::string&, unsigned&)
{
    return s.getRepositoryManager()->getRepositories(nullptr, *zelServerOwn(s, s.createRepositoryVector()));
}

// Uploads a new file beside `file`.
IZELServerStatus* addItem(IZELServerSession& s, const std::string& file, unsigned&)
{
    spew(file + ".zlw", kContent);
    Texts t(s);
    return zelServerOwn(s, s.createRepository())->addItem(t("a.zlw"), t(file + ".zlw"));
}

const struct {
    const char* name;
    std::vector<Step> cut;  // the exchange whose answer is cut, after the sign-in
    Call call;              // null: the sign-in itself is cut
} kKinds[] = {
    {"sign-in", {readFrame(), answer(signedIn())}, nullptr},
    {"plain", {readFrame(), answer(reply("SUCCESS", "true"))}, repositoryExists},
    {"list", {readFrame(), answer(reply("SUCCESS", R"(<R><REPOSITORY name="A"/></R>)"))}, listRepositories},
    {"upload",
     {readFrame(),
      answer(readyAck()),
      readFrame(),
      answer(readyAck()),
      {Step::ReadRaw, kContent},
      answer(reply("SUCCESS", "true"))},
     addItem},
    // Every download shares this answer and its reading: the file header, the content, the final "true".
    {"download",
     {readFrame(),
      answer(fileHeader(kContent.size(), crc32(kContent))),
      readFrame(),
      {Step::Write, kContent},
      readFrame(),
      answer(reply("SUCCESS", "true"))},
     getItem},
    // Only the answer on the command's own connection: after all of it the library waits for the
    // server's call on the result port, which no hang-up ends.
    {"result port", {readFrame(), answer(reply("SUCCESS", "queued"))}, transactJob},
};

// The script of one case: the sign-in, the cut exchange up to `offset` answer bytes, then the
// hang-up, and a second connection for the new sign-in and one plain command.
void script(FakeServer& server, const std::vector<Step>& cut, bool signInFirst, std::size_t offset)
{
    if (signInFirst) {
        server.exchange(firstHandshake(), signedIn());
    }
    for (const Step& step : cut) {
        if (step.kind == Step::Read) {
            server.expectAnyFrame();
        } else if (step.kind == Step::ReadRaw) {
            server.expectRaw(step.bytes);
        } else if (offset < step.bytes.size()) {
            server.sendRaw(step.bytes.substr(0, offset));
            break;
        } else {
            server.sendRaw(step.bytes);
            offset -= step.bytes.size();
        }
    }
    server.closeConnection().acceptNext().exchange(firstHandshake(), signedIn());
    server.expectAnyFrame().sendFrame(reply("SUCCESS", "true"));
}

TEST_F(HostileSessionTest, CutAnswersEndInAStatusKeepTheDestinationAndTheSessionSignsInAgain)
{
    for (const auto& kind : kKinds) {
        std::size_t answerBytes = 0;
        for (const Step& step : kind.cut) {
            answerBytes += step.kind == Step::Write ? step.bytes.size() : 0;
        }
        for (std::size_t offset = 0; offset < answerBytes; ++offset) {
            SCOPED_TRACE(std::string(kind.name) + ", hang-up after " + std::to_string(offset) + " bytes");
            const TempDir folder("zel-cut");
            const std::string kept = (folder.path() / "kept").string();
            spew(kept, "old contents");
            FakeServer server;
            script(server, kind.cut, kind.call != nullptr, offset);
            server.start();
            ZEL_destroyServerSession(&session);
            ZEL_createServerSession(&session);
            unsigned number = init(server.port()).number;
            unsigned unused = 0;
            if (kind.call != nullptr && number == 0) {
                number = outcome(kind.call(*session, kept, unused)).number;
            }
            unsigned found = 0;
            const bool held = number != 0 && slurp(kept) == "old contents" && init(server.port()).number == 0 &&
                              outcome(repositoryExists(*session, "", found)).number == 0 && found == 1;
            EXPECT_TRUE(held) << "status " << number << ", file \"" << slurp(kept) << "\"";
            server.finish();
            if (!held) {
                break;  // one report per kind
            }
        }
    }
}

}  // namespace
}  // namespace zeltest
