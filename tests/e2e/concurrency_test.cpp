// Sixteen sessions on sixteen threads at once, each with its own items, files and job, and refused
// operations whose status texts come from the one message catalogue in between; afterwards every one
// of them finds all of its own work intact. The thread sanitizer build runs it too.

#include <atomic>

#include "e2e/e2e_fixture.h"

namespace zeltest {
namespace {

constexpr int kSessions = 16;

// One thread's work; failures are collected as text because gtest assertions belong on the main thread.
std::string work(std::uint16_t port, const std::string& dir, int n)
{
    const std::string tag = "t" + std::to_string(n);
    Client client;
    if (client.signIn(port, "ann", "pw-ann") != 0)
        return tag + ": sign-in: " + client.lastMessage();
    IZELServerSession& session = client.session();
    std::string failures;
    auto check = [&](bool ok, const std::string& what) {
        if (!ok)
            failures += tag + ": " + what + " (" + client.lastMessage() + ")\n";
        return ok;
    };

    const std::string workspace = "#!/bin/sh\n# @parameter MARK | TEXT | none\necho \"mark $MARK\"\n";
    const std::string itemFile = dir + "/" + tag + ".zlw";
    spew(itemFile, workspace);
    auto repository = client.repository("crowd");
    IZELServerString& item = client.text(tag + ".zlw");
    check(client.take(repository->addItem(item, client.text(itemFile))) == 0, "addItem");

    auto area = client.area("DATA");
    if (!area)
        return failures + tag + ": no area\n";
    const std::string content(1000 + n * 997, static_cast<char>('a' + n));
    spew(dir + "/" + tag + ".dat", content);
    IZELServerPath* folder = area->createPath(client.text("/" + tag));
    IZELServerPath* file = area->createPath(client.text("/" + tag), client.text("data.bin"));
    // Every status starts the catalogue when no other status holds it and tears it down with the
    // last one, so these texts race the other threads' statuses.
    int refusals = 0;
    auto refusedUpload = [&] {
        const std::string missing = dir + "/" + tag + ".missing" + std::to_string(++refusals);
        const unsigned number = client.take(area->upload(client.text(missing), *file, nullptr));
        check(number != 0 && client.lastMessage() == "The argument \"src\" has an invalid value: \"" + missing + "\".",
              "refused upload " + std::to_string(refusals));
    };
    refusedUpload();
    check(client.take(area->makeDirectory(*folder)) == 0, "makeDirectory");
    refusedUpload();
    check(client.take(area->upload(client.text(dir + "/" + tag + ".dat"), *file, nullptr)) == 0, "upload");
    refusedUpload();

    auto request = client.own(session.createTransformationRequest(client.text("zeljob"), client.text("crowd"), item));
    request->setPublishedParameter(client.text("MARK"), client.text(tag));
    auto result = client.own(session.createTransformationResult());
    unsigned id = 0;
    IZELServerTransformationManager* jobs = session.getTransformationManager();
    if (check(client.take(jobs->submitJob(*request, id)) == 0, "submitJob")) {
        check(client.waitForJob(id, *result, 60) == kSucceeded, "job result");
        const std::string log = dir + "/" + tag + ".log";
        check(client.outcome([&](unsigned& f) { return jobs->getLogFile(id, client.text(log), f); }) == 1,
              "getLogFile");
        check(slurp(log).find("mark " + tag + "\n") != std::string::npos, "log holds the mark");
    }
    refusedUpload();

    check(client.outcome([&](unsigned& f) { return repository->getItem(item, client.text(itemFile + ".back"), f); }) ==
              1,
          "getItem");
    check(slurp(itemFile + ".back") == workspace, "item content");
    IZELServerString& back = client.text(dir + "/" + tag + ".back");
    check(client.outcome([&](unsigned& f) { return area->download(*file, back, f, nullptr); }) == 1, "download");
    check(slurp(dir + "/" + tag + ".back") == content, "shared file content");

    area->releaseObject(folder);
    area->releaseObject(file);
    return failures;
}

TEST_F(EndToEnd, SixteenSessionsInParallelLoseNothing)
{
    Client audit;
    ASSERT_EQ(audit.signIn(server->port(), "ann", "pw-ann"), 0u);
    auto crowd = audit.repository("crowd");
    std::vector<std::string> failures(kSessions);
    std::vector<std::thread> threads;
    for (int n = 0; n < kSessions; ++n)
        threads.emplace_back([&, n] { failures[n] = work(server->port(), server->directory(), n); });
    for (std::thread& thread : threads)
        thread.join();
    for (const std::string& failure : failures)
        EXPECT_EQ(failure, "");
    for (int n = 0; n < kSessions; ++n) {
        IZELServerString& name = audit.text("t" + std::to_string(n) + ".zlw");
        EXPECT_EQ(audit.outcome([&](unsigned& f) { return crowd->itemExists(name, f); }), 1) << n;
    }
}

}  // namespace
}  // namespace zeltest
