// Replies come from the network: a hostile one must not make the parser read local files, open
// connections, or expand entities without bound.

#include <atomic>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <memory>
#include <optional>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "support/environment.h"
#include "support/sockets.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

constexpr const char* kSecret = "SECRET-MARKER-7f3a9c";

// A file holding the secret marker, removed again at the end of the test.
class SecretFile {
public:
    SecretFile() : path_(folder_.path() / "secret.txt")
    {
        std::ofstream out(path_, std::ios::binary);
        out << kSecret << "\n";
        ok_ = static_cast<bool>(out.flush());
    }
    bool ok() const { return ok_; }
    // The path as the system writes it (a drive letter and backslashes on Windows).
    std::string path() const { return path_.string(); }
    // file:///tmp/... or file:///C:/...
    std::string url() const
    {
        const std::string generic = path_.generic_string();
        return "file://" + std::string(generic.front() == '/' ? "" : "/") + generic;
    }

private:
    zeltest::TempDir folder_{"zel-xml-secret"};
    std::filesystem::path path_;
    bool ok_ = false;
};

// A socket listening on a loopback port that nobody should ever connect to. A watcher accepts and
// drops any connection at once, so that a parser that did connect fails quickly instead of waiting
// for an answer forever.
class Tripwire {
public:
    Tripwire() : listener_(zeltest::listenOnLoopback(8))
    {
        const std::optional<std::uint16_t> port = listener_.valid() ? zeltest::localPort(listener_) : std::nullopt;
        if (port) {
            port_ = *port;
            watcher_ = std::thread([this] { watch(); });
        }
    }
    ~Tripwire()
    {
        stop_ = true;
        if (watcher_.joinable()) {
            watcher_.join();
        }
    }
    unsigned port() const { return port_; }
    std::string url(const std::string& path) const { return "http://127.0.0.1:" + std::to_string(port_) + path; }
    // A connection completes in the kernel's accept queue even before anyone accepts it, so a look
    // with no wait sees one the watcher has not taken yet.
    bool touched() const { return connected_ || pending(std::chrono::milliseconds(0)); }

private:
    bool pending(std::chrono::milliseconds wait) const { return zeltest::waitReadable(listener_, wait); }
    void watch()
    {
        while (!stop_) {
            if (pending(std::chrono::milliseconds(20))) {
                if (zeltest::acceptFrom(listener_).valid()) {
                    connected_ = true;
                }
            }
        }
    }

    zeltest::Socket listener_;
    unsigned port_ = 0;
    std::atomic<bool> stop_{false};
    std::atomic<bool> connected_{false};
    std::thread watcher_;
};

struct Outcome {
    StatusPtr failure;
    std::string text;  // the document's text when it parsed
};

Outcome parse(const std::string& body)
{
    XmlReader reader;
    Outcome outcome;
    outcome.failure.reset(reader.parse(body));
    outcome.text = textContent(reader.rootOf());
    return outcome;
}

TEST(XmlHardening, ExternalEntityNamingALocalFileIsNotRead)
{
    SecretFile secret;
    ASSERT_TRUE(secret.ok());
    const std::string path = secret.path();
    const std::string url = secret.url();
    const struct {
        const char* name;
        std::string body;
    } cases[] = {
        {"file url", "<!DOCTYPE r [<!ENTITY x SYSTEM \"" + url + "\">]><r>&x;</r>"},
        {"plain path", "<!DOCTYPE r [<!ENTITY x SYSTEM \"" + path + "\">]><r>&x;</r>"},
        {"in an attribute default",
         "<!DOCTYPE r [<!ENTITY x SYSTEM \"" + path + "\"><!ATTLIST r a CDATA \"&x;\">]><r/>"},
        {"parameter entity", "<!DOCTYPE r [<!ENTITY % p SYSTEM \"" + url + "\"> %p;]><r>x</r>"},
        {"external subset", "<!DOCTYPE r SYSTEM \"" + url + "\"><r>x</r>"},
        {"public identifier", "<!DOCTYPE r [<!ENTITY x PUBLIC \"-//A//B\" \"" + path + "\">]><r>&x;</r>"},
    };
    for (const auto& c : cases) {
        const Outcome outcome = parse(c.body);
        EXPECT_EQ(outcome.text.find(kSecret), std::string::npos) << c.name;
        if (outcome.failure != nullptr) {
            EXPECT_EQ(outcome.failure->getMessageNumber(), msg::kXmlFailure) << c.name;
            EXPECT_EQ(std::string(outcome.failure->getMessage()).find(kSecret), std::string::npos) << c.name;
        }
    }
}

TEST(XmlHardening, ExternalReferencesMakeNoConnection)
{
    // @ stands for the address of a fresh tripwire.
    const struct {
        const char* name;
        std::string body;
    } cases[] = {
        {"external subset", "<!DOCTYPE r SYSTEM \"@/r.dtd\"><r>x</r>"},
        {"public external subset", "<!DOCTYPE r PUBLIC \"-//A//B\" \"@/p.dtd\"><r/>"},
        {"general entity", "<!DOCTYPE r [<!ENTITY x SYSTEM \"@/e\">]><r>&x;</r>"},
        {"parameter entity", "<!DOCTYPE r [<!ENTITY % p SYSTEM \"@/p\"> %p;]><r/>"},
        {"schema hint", "<r xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\" "
                        "xsi:noNamespaceSchemaLocation=\"@/s.xsd\"/>"},
    };
    for (const auto& c : cases) {
        Tripwire tripwire;
        ASSERT_NE(tripwire.port(), 0u);
        std::string body = c.body;
        body.replace(body.find('@'), 1, tripwire.url(""));
        const Outcome outcome = parse(body);
        EXPECT_FALSE(tripwire.touched()) << c.name;
        if (outcome.failure != nullptr) {
            EXPECT_EQ(outcome.failure->getMessageNumber(), msg::kXmlFailure) << c.name;
        }
    }
}

TEST(XmlHardening, NestedEntityBombFails)
{
    std::string body = "<?xml version=\"1.0\"?><!DOCTYPE lolz [<!ENTITY lol0 \"lol\">";
    for (int level = 1; level <= 9; ++level) {
        body += "<!ENTITY lol" + std::to_string(level) + " \"";
        for (int i = 0; i < 10; ++i) {
            body += "&lol" + std::to_string(level - 1) + ";";
        }
        body += "\">";
    }
    body += "]><lolz>&lol9;</lolz>";
    const Outcome outcome = parse(body);
    ASSERT_NE(outcome.failure, nullptr);
    EXPECT_EQ(outcome.failure->getMessageNumber(), msg::kXmlFailure);
    EXPECT_TRUE(outcome.text.empty());
}

TEST(XmlHardening, WideEntityBlowUpFails)
{
    const std::string big(20000, 'a');
    std::string body = "<!DOCTYPE r [<!ENTITY big \"" + big + "\">]><r>";
    for (int i = 0; i < 1000; ++i) {
        body += "&big;";
    }
    body += "</r>";
    const Outcome outcome = parse(body);
    ASSERT_NE(outcome.failure, nullptr);
    EXPECT_EQ(outcome.failure->getMessageNumber(), msg::kXmlFailure);
}

TEST(XmlHardening, OrdinaryReferencesStillParse)
{
    std::string body = "<r a=\"&lt;&amp;&gt;&quot;&apos;\">";
    std::string expected;
    for (int i = 0; i < 1000; ++i) {
        body += "&amp;&#65;&#x42;";
        expected += "&AB";
    }
    body += "</r>";
    const Outcome outcome = parse(body);
    ASSERT_EQ(outcome.failure, nullptr) << outcome.failure->getMessage();
    EXPECT_EQ(outcome.text, expected);
}

}  // namespace
}  // namespace zel
