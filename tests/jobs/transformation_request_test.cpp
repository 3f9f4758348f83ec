// The job request: workspace paths, the four pair dictionaries, the dirty flag and the exact request
// text the server receives.

#include "jobs/ZELServerTransformationRequest.h"

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "jobs/jobs_factories.h"

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

// A workspace of the repository model whose only answer is its name: the request must not ask it
// for anything else.
class NamedWorkspace final : public IZELServerWorkspace {
public:
    explicit NamedWorkspace(std::string name) : name_(std::move(name)) {}
    void getName(IZELServerString& out) const override { out.set(name_.data(), static_cast<unsigned>(name_.size())); }
    void getTitle(IZELServerString&) const override { unexpected(); }
    void getDescription(IZELServerString&) const override { unexpected(); }
    bool isEnabled() const override { unexpected(); }
    IZELServerVector<IZELServerParameter>& getParameters() override { unexpected(); }
    IZELServerVector<IZELServerDataset>& getSourceDatasets() override { unexpected(); }
    IZELServerVector<IZELServerDataset>& getDestinationDatasets() override { unexpected(); }
    IZELServerVector<IZELServerFeatureType>& getSourceFeatureTypes() override { unexpected(); }
    IZELServerVector<IZELServerFeatureType>& getDestinationFeatureTypes() override { unexpected(); }
    IZELServerPropertyAccessor& getPropertyAccessor() override { unexpected(); }
    IZELServerVector<IZELServerResource>& getResources() override { unexpected(); }
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor&) override { unexpected(); }
    long long getFileSize() const override { unexpected(); }

private:
    [[noreturn]] static void unexpected()
    {
        ADD_FAILURE() << "the request read more than the workspace's name";
        std::abort();
    }
    std::string name_;
};

// ---- Workspace paths and factories

TEST(TransformationRequest, WorkspacePathDropsFourCharactersForTheFolder)
{
    const struct {
        std::string repository;
        std::string workspace;
        std::string path;
    } cases[] = {
        {"R", "w.zlw", "R/w/w.zlw"},
        {"Samples", "harbour.zlw", "Samples/harbour/harbour.zlw"},
        // Four characters, whatever they are.
        {"R", "x.zlwx", "R/x./x.zlwx"},
        {"R", "noextension", "R/noexten/noextension"},
        {"R", "abcd", "R//abcd"},
        // Shorter names lose everything they have, and nothing before them.
        {"R", "abc", "R//abc"},
        {"", "w.zlw", "/w/w.zlw"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.repository + " " + c.workspace);
        EXPECT_EQ(workspacePathOf(c.repository, c.workspace), c.path);
        EXPECT_EQ(Request(str("S"), str(c.repository), str(c.workspace)).workspacePath(), c.path);
        EXPECT_EQ(Request(str("S"), str(c.repository), NamedWorkspace(c.workspace)).workspacePath(), c.path);
    }
    // The path form takes the path as given.
    const Request byPath(str("S"), str("any/thing here.zlw"));
    EXPECT_EQ(byPath.workspacePath(), "any/thing here.zlw");
    EXPECT_EQ(requestText(byPath), textFor("any/thing here.zlw", ""));
}

TEST(TransformationRequest, FactoriesMakeTheThreeFormsOrNullOnAnExhaustedHeap)
{
    std::unique_ptr<IZELServerTransformationRequest> byName(
        makeTransformationRequest(str("S"), str("R"), str("w.zlw")));
    std::unique_ptr<IZELServerTransformationRequest> byPath(makeTransformationRequest(str("S"), str("R/x/y")));
    std::unique_ptr<IZELServerTransformationRequest> byObject(
        makeTransformationRequest(str("S"), str("R"), NamedWorkspace("v.zlw")));
    ASSERT_TRUE(byName && byPath && byObject);
    EXPECT_EQ(requestText(*byName), textFor("R/w/w.zlw", ""));
    EXPECT_EQ(requestText(*byPath), textFor("R/x/y", ""));
    EXPECT_EQ(requestText(*byObject), textFor("R/v/v.zlw", ""));
    ZELServerString keyword;
    byObject->getKeyword(keyword);
    EXPECT_EQ(keyword.str(), "S");

    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationRequest(str("S"), str("R/x/y")), nullptr);
}

// ---- Request text

TEST(TransformationRequest, ParametersInNameOrderWithTheLastValueThenEmbeddedDirectives)
{
    Request request(str("S"), str("R"), str("w.zlw"));
    request.setEmbeddedDirective(str("LOG_LEVEL"), str("2"));
    request.setPublishedParameter(str("ZONE"), str("first"));
    request.setPublishedParameter(str("AREA"), str("a<b & c>d"));
    request.setPublishedParameter(str("ZONE"), str("north"));
    EXPECT_EQ(requestText(request),
              textFor("R/w/w.zlw", parameter("AREA", "a&lt;b &amp; c&gt;d") + parameter("ZONE", "north") +
                                       R"(<ZEL_DIRECTIVE name="LOG_LEVEL">2</ZEL_DIRECTIVE>)"));
}

TEST(TransformationRequest, AttributeQuotesAreEscapedAndLocalCodePageTextBecomesUtf8)
{
    Request request(str("S"), str("p"));
    request.setPublishedParameter(str("a\"b"), str(""));
    request.setPublishedParameter(str("CITY"), str("Z\xFCrich"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("CITY", "Z\xC3\xBCrich") +
                                                     R"(<PUBLISHED_PARAMETER name="a&quot;b"></PUBLISHED_PARAMETER>)"));
}

TEST(TransformationRequest, TextThatCannotBeWrittenLeavesOutUntouchedAndStaysDirty)
{
    Request request(str("S"), str("p"));
    request.setPublishedParameter(str("P"), str("a\0b"s));
    ZELServerString out("before");
    request.getRequestText(out);
    EXPECT_EQ(out.str(), "before");
    EXPECT_TRUE(request.dirty());

    // Once the value is fixed the next call composes it.
    request.setPublishedParameter(str("P"), str("ab"));
    EXPECT_EQ(requestText(request), textFor("p", parameter("P", "ab")));
    EXPECT_FALSE(request.dirty());
}

// ---- Dirty flag

TEST(TransformationRequest, EmbeddedDirectivesDoNotRecomposeUntilKeywordIsSetAgain)
{
    Request request(str("S"), str("p"));
    EXPECT_TRUE(request.dirty());
    const std::string first = requestText(request);
    EXPECT_FALSE(request.dirty());

    request.setEmbeddedDirective(str("D"), str("1"));
    request.setEmbeddedDirectives(ZELServerStringArray(Pairs{"E", "2"}));
    EXPECT_FALSE(request.dirty());
    EXPECT_EQ(requestText(request), first);

    request.setKeyword(str("S"));
    EXPECT_TRUE(request.dirty());
    EXPECT_EQ(requestText(request), textFor("p", R"(<ZEL_DIRECTIVE name="D">1</ZEL_DIRECTIVE>)"
                                                 R"(<ZEL_DIRECTIVE name="E">2</ZEL_DIRECTIVE>)"));
}

TEST(TransformationRequest, OnlyKeywordAndPublishedParametersSetTheDirtyFlag)
{
    const ZELServerStringArray pair(Pairs{"N", "1"});
    const struct {
        const char* what;
        void (*change)(Request&, const ZELServerStringArray&);
        bool dirty;
    } cases[] = {
        {"keyword", [](Request& r, const ZELServerStringArray&) { r.setKeyword(str("other")); }, true},
        {"one parameter", [](Request& r, const ZELServerStringArray&) { r.setPublishedParameter(str("P"), str("1")); },
         true},
        {"parameter list", [](Request& r, const ZELServerStringArray& p) { r.setPublishedParameters(p); }, true},
        {"directive", [](Request& r, const ZELServerStringArray&) { r.setDirective(str("D"), str("1")); }, false},
        {"directive list", [](Request& r, const ZELServerStringArray& p) { r.setDirectives(p); }, false},
        {"embedded directive",
         [](Request& r, const ZELServerStringArray&) { r.setEmbeddedDirective(str("E"), str("1")); }, false},
        {"notification", [](Request& r, const ZELServerStringArray&) { r.setNotification(str("T"), str("m")); }, false},
        {"notification list", [](Request& r, const ZELServerStringArray& p) { r.setNotifications(p); }, false},
    };
    for (const auto& c : cases) {
        Request request(str("S"), str("p"));
        requestText(request);
        ASSERT_FALSE(request.dirty());
        c.change(request, pair);
        EXPECT_EQ(request.dirty(), c.dirty) << c.what;
    }
}

// ---- Dictionaries

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

TEST(TransformationRequest, DictionaryPairsReplaceByNameComeOutInNameOrderAndStayApart)
{
    for (const Dictionary& d : kDictionaries) {
        SCOPED_TRACE(d.what);
        Request request(str("S"), str("p"));
        (request.*d.setAll)(ZELServerStringArray(Pairs{"b", "1", "a", "2", "b", "3", "odd"}));
        (request.*d.setOne)(str("c"), str("4"));
        (request.*d.setOne)(str("a"), str("5"));

        ZELServerStringArray all(Pairs{"kept"});
        (request.*d.getAll)(all);
        EXPECT_EQ(all.items(), (Pairs{"kept", "a", "5", "b", "3", "c", "4"}));
        ZELServerString value("untouched");
        EXPECT_EQ((request.*d.getOne)(str("b"), value), 1u);
        EXPECT_EQ(value.str(), "3");
        value.assign("untouched");
        EXPECT_EQ((request.*d.getOne)(str("odd"), value), 0u);
        EXPECT_EQ(value.str(), "untouched");

        for (const Dictionary& other : kDictionaries) {
            ZELServerStringArray pairs;
            (request.*other.getAll)(pairs);
            EXPECT_EQ(pairs.entries(), other.getAll == d.getAll ? 6u : 0u) << "seen in " << other.what;
        }
    }
}

}  // namespace
}  // namespace zel
