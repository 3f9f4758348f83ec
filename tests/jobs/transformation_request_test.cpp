// The job request: workspace paths, the four pair dictionaries, the dirty flag and the exact request
// text the server receives.

#include "jobs/ZELServerTransformationRequest.h"

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "jobs/jobs_factories.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/reply_readers.h"

using namespace std::string_literals;

namespace zel {
namespace {

using Request = ZELServerTransformationRequest;
using Pairs = std::vector<std::string>;

ZELServerString str(const std::string& text) { return ZELServerString(text); }

std::string requestText(const IZELServerTransformationRequest& request)
{
    ZELServerString out;
    request.getRequestText(out);
    return out.str();
}

std::string textFor(const std::string& path, const std::string& elements)
{
    const std::string document = elements.empty() ? "<TRANSFORMATION_REQUEST/>"
                                                  : "<TRANSFORMATION_REQUEST>" + elements + "</TRANSFORMATION_REQUEST>";
    return path + " -XML_PARAMETER " + R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)" + document;
}

std::string parameter(const std::string& name, const std::string& value)
{
    return "<PUBLISHED_PARAMETER name=\"" + name + "\">" + value + "</PUBLISHED_PARAMETER>";
}

TEST(TransformationRequest, WorkspacePathDropsFourCharactersForTheFolderInEveryForm)
{
    const struct {
        std::string repository;
        std::string workspace;
        std::string path;
    } cases[] = {
        {"Samples", "harbour.zlw", "Samples/harbour/harbour.zlw"},
        {"R", "abc", "R//abc"},  // shorter names lose everything they have, and nothing before them
        {"", "w.zlw", "/w/w.zlw"},
    };
    for (const auto& c : cases) {
        ZELServerWorkspace workspace(nullptr);
        ASSERT_EQ(
            readWorkspaceReply("<R><WORKSPACE_DEFINITIONS name=\"" + c.workspace + "\"/></R>", nullptr, workspace), 0);
        EXPECT_EQ(requestText(Request(str("S"), str(c.repository), str(c.workspace))), textFor(c.path, ""));
        EXPECT_EQ(requestText(Request(str("S"), str(c.repository), workspace)), textFor(c.path, ""));
    }
    // An exhausted heap makes no request.
    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationRequest(str("S"), str("R/x/y")), nullptr);
}

TEST(TransformationRequest, TextHoldsParametersInNameOrderEscapedAsUtf8ThenEmbeddedDirectives)
{
    Request request(str("S"), str("p"));
    request.setEmbeddedDirective(str("LOG_LEVEL"), str("2"));
    request.setPublishedParameter(str("ZONE"), str("first"));
    request.setPublishedParameter(str("AREA"), str("a<b & c>d"));
    request.setPublishedParameter(str("ZONE"), str("north"));
    request.setPublishedParameter(str("a\"b"), str("Z\xFCrich"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("AREA", "a&lt;b &amp; c&gt;d") + parameter("ZONE", "north") +
                                                     parameter("a&quot;b", "Z\xC3\xBCrich") +
                                                     R"(<ZEL_DIRECTIVE name="LOG_LEVEL">2</ZEL_DIRECTIVE>)"));
}

TEST(TransformationRequest, TextIsComposedAgainOnlyAfterAChangeThatNeedsIt)
{
    Request request(str("S"), str("p"));
    request.setPublishedParameter(str("P"), str("a\0b"s));
    ZELServerString out("before");
    request.getRequestText(out);
    EXPECT_EQ(out.str(), "before");
    EXPECT_TRUE(request.dirty());
    request.setPublishedParameter(str("P"), str("ab"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("P", "ab")));
    EXPECT_FALSE(request.dirty());
    // Embedded directives wait for the next change that recomposes the text.
    request.setEmbeddedDirective(str("D"), str("1"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("P", "ab")));
    request.setKeyword(str("S"));
    EXPECT_EQ(requestText(request),
              textFor("p", parameter("P", "ab") + R"(<ZEL_DIRECTIVE name="D">1</ZEL_DIRECTIVE>)"));
}

struct Dictionary {
    const char* what;
    void (Request::*setOne)(const IZELServerString&, const IZELServerString&);
    void (Request::*setAll)(const IZELServerStringArray&);
    unsigned (Request::*getOne)(const IZELServerString&, IZELServerString&) const;
    void (Request::*getAll)(IZELServerStringArray&) const;
};

const Dictionary kDictionaries[] = {
    {"published", &Request::setPublishedParameter, &Request::setPublishedParameters, &Request::getPublishedParameter,
     &Request::getPublishedParameters},
    {"directives", &Request::setDirective, &Request::setDirectives, &Request::getDirective, &Request::getDirectives},
    {"embedded", &Request::setEmbeddedDirective, &Request::setEmbeddedDirectives, &Request::getEmbeddedDirective,
     &Request::getEmbeddedDirectives},
    {"notifications", &Request::setNotification, &Request::setNotifications, &Request::getNotification,
     &Request::getNotifications},
};

TEST(TransformationRequest, DictionaryPairsReplaceByNameAndStayApart)
{
    for (const Dictionary& d : kDictionaries) {
        SCOPED_TRACE(d.what);
        Request request(str("S"), str("p"));
        (request.*d.setAll)(ZELServerStringArray(Pairs{"b", "1", "a", "2", "odd"}));
        (request.*d.setOne)(str("a"), str("5"));
        ZELServerStringArray all(Pairs{"kept"});
        (request.*d.getAll)(all);
        EXPECT_EQ(all.items(), (Pairs{"kept", "a", "5", "b", "1"}));
        ZELServerString value("untouched");
        EXPECT_EQ((request.*d.getOne)(str("b"), value), 1u);
        EXPECT_EQ(value.str(), "1");
        value.assign("untouched");
        EXPECT_EQ((request.*d.getOne)(str("odd"), value), 0u);
        EXPECT_EQ(value.str(), "untouched");

        for (const Dictionary& other : kDictionaries) {
            ZELServerStringArray pairs;
            (request.*other.getAll)(pairs);
            EXPECT_EQ(pairs.entries(), other.getAll == d.getAll ? 4u : 0u) << "seen in " << other.what;
        }
    }
}

}  // namespace
}  // namespace zel
