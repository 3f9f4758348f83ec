// Reference counting of the XML library's start and stop.

#include <memory>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "transport/xml_platform.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

TEST(XmlPlatform, FirstReferenceStartsAndLastStops)
{
    ASSERT_EQ(XmlPlatform::referenceCount(), 0u);
    const unsigned long starts = XmlPlatform::startCount();
    const unsigned long stops = XmlPlatform::stopCount();

    XmlPlatformRef a;
    XmlPlatformRef b;
    EXPECT_FALSE(a.held());
    StatusPtr failure(a.acquire());
    ASSERT_EQ(failure, nullptr);
    failure.reset(a.acquire());  // already held: no second reference
    ASSERT_EQ(failure, nullptr);
    EXPECT_EQ(XmlPlatform::referenceCount(), 1u);
    failure.reset(b.acquire());
    ASSERT_EQ(failure, nullptr);
    EXPECT_EQ(XmlPlatform::referenceCount(), 2u);
    EXPECT_EQ(XmlPlatform::startCount(), starts + 1);

    a.reset();
    a.reset();  // nothing held any more
    EXPECT_EQ(XmlPlatform::referenceCount(), 1u);
    EXPECT_EQ(XmlPlatform::stopCount(), stops);
    b.reset();
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
    EXPECT_EQ(XmlPlatform::stopCount(), stops + 1);

    XmlPlatform::release();  // an unmatched release is ignored
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
    EXPECT_EQ(XmlPlatform::stopCount(), stops + 1);
}

TEST(XmlPlatform, LibraryCanBeStartedAgainAfterStopping)
{
    ASSERT_EQ(XmlPlatform::referenceCount(), 0u);
    const unsigned long starts = XmlPlatform::startCount();
    for (int round = 0; round < 3; ++round) {
        XmlReader reader;
        StatusPtr failure(reader.parse("<R/>"));
        ASSERT_EQ(failure, nullptr) << "round " << round;
    }
    EXPECT_EQ(XmlPlatform::startCount(), starts + 3);
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
}

TEST(XmlPlatform, MovedReferenceIsReleasedOnce)
{
    ASSERT_EQ(XmlPlatform::referenceCount(), 0u);
    {
        XmlPlatformRef first;
        StatusPtr failure(first.acquire());
        ASSERT_EQ(failure, nullptr);
        XmlPlatformRef second(std::move(first));
        EXPECT_FALSE(first.held());
        EXPECT_TRUE(second.held());
        XmlPlatformRef third;
        failure.reset(third.acquire());
        ASSERT_EQ(failure, nullptr);
        EXPECT_EQ(XmlPlatform::referenceCount(), 2u);
        third = std::move(second);  // third's own reference goes
        EXPECT_EQ(XmlPlatform::referenceCount(), 1u);
        EXPECT_TRUE(third.held());
    }
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
}

// Sessions on different threads start and stop the library concurrently; the count must end where
// it began, with every start matched by one stop.
TEST(XmlPlatform, ConcurrentUsersBalance)
{
    ASSERT_EQ(XmlPlatform::referenceCount(), 0u);
    const unsigned long starts = XmlPlatform::startCount();
    const unsigned long stops = XmlPlatform::stopCount();
    std::vector<std::thread> threads;
    std::vector<int> failures(4, 0);
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([t, &failures] {
            for (int i = 0; i < 50; ++i) {
                XmlReader reader;
                StatusPtr failure(reader.parse("<R><C/></R>"));
                if (failure != nullptr || reader.rootOf() == nullptr) {
                    ++failures[t];
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(failures, std::vector<int>(4, 0));
    EXPECT_EQ(XmlPlatform::referenceCount(), 0u);
    EXPECT_GE(XmlPlatform::startCount(), starts + 1);
    EXPECT_EQ(XmlPlatform::startCount() - starts, XmlPlatform::stopCount() - stops);
}

}  // namespace
}  // namespace zel
