// Replies come from the network: a hostile one must not make the parser read local files, open
// connections, or expand entities without bound.

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <memory>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include "api/message_numbers.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {
namespace {

using StatusPtr = std::unique_ptr<IZELServerStatus>;

constexpr const char* kSecret = "SECRET-MARKER-7f3a9c";

// A file holding the secret marker, removed again at the end of the test.
class SecretFile {
public:
    SecretFile() {
        char name[] = "/tmp/zel_xml_secret_XXXXXX";
        const int fd = mkstemp(name);
        if (fd >= 0) {
            path_ = name;
            const std::string content = std::string(kSecret) + "\n";
            ok_ = write(fd, content.data(), content.size()) == static_cast<ssize_t>(content.size());
            close(fd);
        }
    }
    ~SecretFile() {
        if (!path_.empty()) {
            std::remove(path_.c_str());
        }
    }
    bool ok() const { return ok_; }
    const std::string& path() const { return path_; }

private:
    std::string path_;
    bool ok_ = false;
};

// A socket listening on a loopback port that nobody should ever connect to. A watcher accepts and
// drops any connection at once, so that a parser that did connect fails quickly instead of waiting
// for an answer forever.
class Tripwire {
public:
    Tripwire() {
        fd_ = socket(AF_INET, SOCK_STREAM, 0);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        address.sin_port = 0;
        socklen_t length = sizeof address;
        if (fd_ >= 0 && bind(fd_, reinterpret_cast<sockaddr*>(&address), sizeof address) == 0 &&
            listen(fd_, 8) == 0 && getsockname(fd_, reinterpret_cast<sockaddr*>(&address), &length) == 0) {
            port_ = ntohs(address.sin_port);
            watcher_ = std::thread([this] { watch(); });
        }
    }
    ~Tripwire() {
        stop_ = true;
        if (watcher_.joinable()) {
            watcher_.join();
        }
        if (fd_ >= 0) {
            close(fd_);
        }
    }
    unsigned port() const { return port_; }
    std::string url(const std::string& path) const {
        return "http://127.0.0.1:" + std::to_string(port_) + path;
    }
    // A connection completes in the kernel's accept queue even before anyone accepts it, so a poll
    // with no wait sees one the watcher has not taken yet.
    bool touched() const { return connected_ || pending(0); }

private:
    bool pending(int waitMs) const {
        pollfd p{fd_, POLLIN, 0};
        return poll(&p, 1, waitMs) > 0 && (p.revents & POLLIN) != 0;
    }
    void watch() {
        while (!stop_) {
            if (pending(20)) {
                const int client = accept(fd_, nullptr, nullptr);
                if (client >= 0) {
                    connected_ = true;
                    close(client);
                }
            }
        }
    }

    int fd_ = -1;
    unsigned port_ = 0;
    std::atomic<bool> stop_{false};
    std::atomic<bool> connected_{false};
    std::thread watcher_;
};

struct Outcome {
    StatusPtr failure;
    std::string text;  // the document's text when it parsed
};

Outcome parse(const std::string& body) {
    XmlReader reader;
    Outcome outcome;
    outcome.failure.reset(reader.parse(body));
    outcome.text = textContent(reader.rootOf());
    return outcome;
}

TEST(XmlHardening, ExternalEntityNamingALocalFileIsNotRead) {
    SecretFile secret;
    ASSERT_TRUE(secret.ok());
    const std::string& path = secret.path();
    const struct {
        const char* name;
        std::string body;
    } cases[] = {
        {"file url", "<!DOCTYPE r [<!ENTITY x SYSTEM \"file://" + path + "\">]><r>&x;</r>"},
        {"plain path", "<!DOCTYPE r [<!ENTITY x SYSTEM \"" + path + "\">]><r>&x;</r>"},
        {"in an attribute default", "<!DOCTYPE r [<!ENTITY x SYSTEM \"" + path + "\"><!ATTLIST r a CDATA \"&x;\">]><r/>"},
        {"parameter entity", "<!DOCTYPE r [<!ENTITY % p SYSTEM \"file://" + path + "\"> %p;]><r>x</r>"},
        {"external subset", "<!DOCTYPE r SYSTEM \"file://" + path + "\"><r>x</r>"},
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

TEST(XmlHardening, ReferencedExternalEntityFailsTheParse) {
    SecretFile secret;
    ASSERT_TRUE(secret.ok());
    const Outcome outcome = parse("<!DOCTYPE r [<!ENTITY x SYSTEM \"" + secret.path() + "\">]><r>&x;</r>");
    ASSERT_NE(outcome.failure, nullptr);
    EXPECT_EQ(outcome.failure->getMessageNumber(), msg::kXmlFailure);
    EXPECT_NE(std::string(outcome.failure->getMessage()).find("External entities are not allowed"), std::string::npos)
        << outcome.failure->getMessage();
}

TEST(XmlHardening, ExternalReferencesMakeNoConnection) {
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

TEST(XmlHardening, NestedEntityBombFails) {
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

TEST(XmlHardening, WideEntityBlowUpFails) {
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

TEST(XmlHardening, OrdinaryReferencesStillParse) {
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

    const Outcome internal = parse("<!DOCTYPE r [<!ENTITY co \"Acme\">]><r>&co; and &co;</r>");
    ASSERT_EQ(internal.failure, nullptr) << internal.failure->getMessage();
    EXPECT_EQ(internal.text, "Acme and Acme");
}

}  // namespace
}  // namespace zel
