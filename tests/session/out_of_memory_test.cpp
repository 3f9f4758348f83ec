// Memory running out anywhere inside one operation of the public interface: the program's allocator
// is replaced so that the Nth allocation of the test's own thread throws std::bad_alloc, for N = 1, 2,
// ... until an operation runs through without meeting the failure. Each time no exception may leave
// the library, the out-of-memory routine must have run or the failure must have come back as a
// status (or been survived with the right answer), and the session must go on working.

#include <atomic>
#include <cstdlib>
#include <fstream>
#include <functional>
#include <new>
#include <optional>
#include <string>

#include <gtest/gtest.h>
#ifdef __SANITIZE_ADDRESS__
#include <sanitizer/lsan_interface.h>
#endif

#include "api/heap.h"
#include "hostile_fixture.h"
#include "support/environment.h"
#include "support/helpers.h"

namespace {

// Allocations of this thread left before the failing one; 0 when nothing is to fail.
thread_local unsigned long allocationsBeforeFailure = 0;
thread_local bool failureMet = false;

}  // namespace

// GCC takes malloc under operator new and free under operator delete for a mismatch; they are this
// program's one allocator. Every form is replaced, so that no block made by one allocator (a
// sanitizer's, say) is released by the other.
#if defined(__GNUC__) && !defined(__clang__)
#pragma GCC diagnostic ignored "-Wmismatched-new-delete"
#endif

void* operator new(std::size_t size)
{
    if (allocationsBeforeFailure != 0 && --allocationsBeforeFailure == 0) {
        failureMet = true;
        throw std::bad_alloc();
    }
    if (void* block = std::malloc(size == 0 ? 1 : size)) {
        return block;
    }
    throw std::bad_alloc();
}
void* operator new[](std::size_t size) { return ::operator new(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    try {
        return ::operator new(size);
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}
void* operator new[](std::size_t size, const std::nothrow_t& tag) noexcept { return ::operator new(size, tag); }
void operator delete(void* block) noexcept { std::free(block); }
void operator delete[](void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
void operator delete[](void* block, std::size_t) noexcept { std::free(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { std::free(block); }
void operator delete[](void* block, const std::nothrow_t&) noexcept { std::free(block); }

namespace zeltest {
namespace {

using namespace std::string_literals;

std::atomic<int> exhaustionReports{0};
void noteExhaustion(int) { ++exhaustionReports; }

const std::string kLongText = "a text longer than any short-string buffer keeps";

// What the operations work on, made before memory is made to fail, so that only the library's own
// allocations meet the failure.
struct Objects {
    explicit Objects(IZELServerSession& s, const std::string& folder) : session(s), destination(folder + "/kept.zlw")
    {
        text->assign(kLongText.c_str());
        service->setName(*text);
        std::ofstream(destination, std::ios::binary) << "old";
    }
    ~Objects() { area->releaseObject(root); }

    template <class T>
    ZELServerOwned<T> own(T* object)
    {
        return zelServerOwn(session, object);
    }

    IZELServerSession& session;
    ZELServerOwned<IZELServerString> text = own(session.createString());
    ZELServerOwned<IZELServerString> out = own(session.createString());
    ZELServerOwned<IZELServerStringArray> list = own(session.createStringArray());
    ZELServerOwned<IZELServerService> service = own(session.createService());
    ZELServerOwned<IZELServerVector<IZELServerService>> services = own(session.createServiceVector());
    ZELServerOwned<IZELServerTransformationRequest> request = own(session.createTransformationRequest(*text, *text));
    ZELServerOwned<IZELServerPropertyAccessor> accessor = own(session.createPropertyAccessor());
    ZELServerOwned<IZELServerVector<IZELServerRepository>> repositories = own(session.createRepositoryVector());
    ZELServerOwned<IZELServerRepository> repository = own(session.createRepository());
    ZELServerOwned<IZELServerWorkspace> made;
    ZELServerOwned<IZELServerMountPoint> area = own(session.createMountPoint());
    IZELServerPath* root = area->createPath(*text);
    ZELServerOwned<IZELServerVector<IZELServerFileInfo>> entries = own(session.createFileInfoVector());
    unsigned flag = 0;
    std::string destination;
};

std::string textOf(const IZELServerString& s) { return std::string(s.data(), s.length()); }

// One operation kind: the server's part of one call (null when it needs none), the call itself
// (exactly one operation of the interface), and what it handed back, read afterwards.
struct Kind {
    const char* name;
    void (*serve)(FakeServer&);
    std::function<IZELServerStatus*(Objects&)> call;
    std::function<std::string(Objects&)> answer;
    std::string expected;
};

const Kind kKinds[] = {
    {"session factory", nullptr, [](Objects& o) { return o.made = o.own(o.session.createWorkspace()), nullptr; },
     [](Objects& o) { return std::string(o.made ? "made" : ""); }, "made"},
    {"string", nullptr, [](Objects& o) { return o.out->assign(kLongText.c_str()), nullptr; },
     [](Objects& o) { return textOf(*o.out); }, kLongText},
    {"string list", nullptr, [](Objects& o) { return o.list->appendTokens("north%south%east", "%"), nullptr; },
     [](Objects& o) { return std::to_string(o.list->entries()) + o.list->element(2); }, "3east"},
    {"vector", nullptr,
     [](Objects& o) {
         return o.services->append(o.service.release()), nullptr;  // owned by the vector now
     },
     [](Objects& o) { return std::to_string(o.services->entries()); }, "1"},
    {"object getter", nullptr, [](Objects& o) { return o.service->getName(*o.out), nullptr; },
     [](Objects& o) { return textOf(*o.out); }, kLongText},
    {"object setter", nullptr, [](Objects& o) { return o.service->setDisplayName(*o.text), nullptr; },
     [](Objects& o) {
         o.service->getDisplayName(*o.out);
         return textOf(*o.out);
     },
     kLongText},
    {"job request", nullptr, [](Objects& o) { return o.request->setDirective(*o.text, *o.text), nullptr; },
     [](Objects& o) {
         const unsigned found = o.request->getDirective(*o.text, *o.out);
         return std::to_string(found) + textOf(*o.out);
     },
     "1" + kLongText},
    {"property accessor", nullptr,
     [](Objects& o) { return o.accessor->setProperty(*o.text, *o.text, *o.text), nullptr; },
     [](Objects& o) {
         const bool found = o.accessor->getPropertyValue(*o.text, *o.text, *o.out);
         return std::to_string(found) + textOf(*o.out);
     },
     "1" + kLongText},
    {"command with a text answer",
     [](FakeServer& s) { s.expectAnyFrame().sendFrame(reply("SUCCESS", "build 4711 of the server")); },
     [](Objects& o) { return o.session.getSessionProperty(*o.text, *o.out); },
     [](Objects& o) { return textOf(*o.out); }, "build 4711 of the server"},
    {"command with a list of objects",
     [](FakeServer& s) {
         s.expectAnyFrame().sendFrame(reply("SUCCESS", R"(<R><REPOSITORY name="Samples" description="d"/></R>)"));
     },
     [](Objects& o) { return o.session.getRepositoryManager()->getRepositories(nullptr, *o.repositories); },
     [](Objects& o) {
         if (o.repositories->entries() != 1) {
             return std::to_string(o.repositories->entries());
         }
         o.repositories->element(0)->getName(*o.out);
         return textOf(*o.out);
     },
     "Samples"},
    {"job submission", [](FakeServer& s) { s.expectAnyFrame().sendFrame(reply("SUCCESS", "17")); },
     [](Objects& o) {
         return o.session.getTransformationManager()->submitJobString(*o.text, *o.text, *o.list, o.flag);
     },
     [](Objects& o) { return std::to_string(o.flag); }, "17"},
    {"listing with depth",  // the same answer at each level, so a retry reads it whatever the failure took
     [](FakeServer& s) {
         const Bytes folder = reply("SUCCESS", R"(<L><FILEINFO filetype="DIR"><PATH name="in"/></FILEINFO></L>)");
         s.expectAnyFrame().sendFrame(folder).expectAnyFrame().sendFrame(folder);
     },
     [](Objects& o) { return o.area->list(*o.root, 1, *o.entries); },
     [](Objects& o) { return std::to_string(o.entries->entries()); }, "2"},
    {"download",
     [](FakeServer& s) {
         s.expectAnyFrame()
             .sendFrame(fileHeader(5, crc32("fresh")))
             .expectFrame(readyAck())
             .sendRaw("fresh")
             .expectFrame(readyAck())
             .sendFrame(reply("SUCCESS", "true"));
     },
     [](Objects& o) {
         o.out->assign(o.destination.c_str());
         return o.repository->getItem(*o.text, *o.out, o.flag);
     },
     [](Objects& o) { return std::to_string(o.flag) + slurp(o.destination); }, "1fresh"},
};

class OutOfMemoryTest : public HostileSessionTest {
protected:
    void SetUp() override
    {
        HostileSessionTest::SetUp();
        previousRoutine = zel::heap::setFailureRoutine(&noteExhaustion);
    }
    void TearDown() override
    {
        zel::heap::setFailureRoutine(previousRoutine);
        HostileSessionTest::TearDown();
    }

    // Runs the call with the Nth allocation failing (0: none); false when an exception escaped.
    static bool callFailingAt(const Kind& kind, Objects& objects, unsigned long n, IZELServerStatus*& status)
    {
#ifdef __SANITIZE_ADDRESS__
        // The XML library keeps what it held when memory ran out in the middle of a document (it
        // declares the parser unusable instead of cleaning up), so blocks made during a failing call
        // are not leak-checked; the calls with memory to spare are.
        std::optional<__lsan::ScopedDisabler> leaksUnchecked;
        if (n != 0) {
            leaksUnchecked.emplace();
        }
#endif
        failureMet = false;
        allocationsBeforeFailure = n;
        try {
            status = kind.call(objects);
        } catch (...) {
            allocationsBeforeFailure = 0;
            return false;
        }
        allocationsBeforeFailure = 0;
        return true;
    }

    zel::heap::FailureRoutine previousRoutine = nullptr;
};

TEST_F(OutOfMemoryTest, EveryOperationKindSurvivesMemoryRunningOutAtAnyAllocation)
{
    for (const Kind& kind : kKinds) {
        // Every one of the first 64 allocations, then every eighth larger step, up to the last one.
        for (unsigned long n = 1;; n = n < 64 ? n + 1 : n + n / 8) {
            SCOPED_TRACE(std::string(kind.name) + ", allocation " + std::to_string(n));
            const TempDir folder("zel-oom");
            std::optional<FakeServer> server;
            if (kind.serve != nullptr) {
                server.emplace().exchange(firstHandshake(), signedIn());
                kind.serve(*server);
                kind.serve(*server);
                signIn(*server);
            }
            Objects objects(*session, folder.string());
            const int reportsBefore = exhaustionReports;
            IZELServerStatus* status = nullptr;
            ASSERT_TRUE(callFailingAt(kind, objects, n, status)) << "an exception left the library";
            const bool met = failureMet;
            const Outcome got = outcome(status);
            const std::string answer = kind.answer(objects);
            if (!met) {
                EXPECT_EQ(got.number, 0u) << got.message;
                EXPECT_EQ(answer, kind.expected);
                outcome(session->disconnect());
                break;
            }
            EXPECT_TRUE(exhaustionReports > reportsBefore || got.number != 0 || answer == kind.expected)
                << got.message << answer;
            if (got.number != 0 && kind.serve != nullptr) {
                EXPECT_EQ(slurp(objects.destination), "old") << "a failed operation kept the caller's file";
            }
            // The same operation again, with memory to spare: the right answer, or, when the failure
            // struck in the middle of the server's answer, a connection given up rather than out of step.
            Objects again(*session, folder.string());
            IZELServerStatus* retried = nullptr;
            ASSERT_TRUE(callFailingAt(kind, again, 0, retried));
            const Outcome second = outcome(retried);
            if (second.number != 393622) {
                EXPECT_EQ(second.number, 0u) << second.message;
                EXPECT_EQ(kind.answer(again), kind.expected);
            }
            outcome(session->disconnect());
        }
    }
}

}  // namespace
}  // namespace zeltest
