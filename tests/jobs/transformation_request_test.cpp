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

constexpr const char* kDeclaration = R"(<?xml version="1.0" encoding="UTF-8" standalone="no" ?>)";

ZELServerString str(const std::string& text) { return ZELServerString(text); }

std::string requestText(const IZELServerTransformationRequest& request)
{
    ZELServerString out;
    request.getRequestText(out);
    return out.str();
}

std::string textFor(const std::string& path, const std::string& elements)
{
    const std::string document = elements.empty()
                                     ? "<TRANSFORMATION_REQUEST/>"
                                     : "<TRANSFORMATION_REQUEST>" + elements + "</TRANSFORMATION_REQUEST>";
    return path + " -XML_PARAMETER " + kDeclaration + document;
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

// ---- Workspace paths ----------------------------------------------------------------------------------

struct PathCase {
    std::string repository;
    std::string workspace;
    std::string path;
};

class WorkspacePath : public ::testing::TestWithParam<PathCase> {};

TEST_P(WorkspacePath, DropsFourCharactersForTheFolder)
{
    const PathCase& c = GetParam();
    EXPECT_EQ(workspacePathOf(c.repository, c.workspace), c.path);

    ZELServerTransformationRequest byName(str("S"), str(c.repository), str(c.workspace));
    EXPECT_EQ(byName.workspacePath(), c.path);
    ZELServerTransformationRequest byObject(str("S"), str(c.repository), NamedWorkspace(c.workspace));
    EXPECT_EQ(byObject.workspacePath(), c.path);
}

const PathCase kPathCases[] = {
    {"R", "w.ext", "R/w/w.ext"},
    {"Samples", "austria.fmw", "Samples/austria/austria.fmw"},
    // Four characters, whatever they are.
    {"R", "x.fmwt", "R/x./x.fmwt"},
    {"R", "noextension", "R/noexten/noextension"},
    {"R", "abcd", "R//abcd"},
    // Shorter names lose everything they have, and nothing before them.
    {"R", "abc", "R//abc"},
    {"R", "a", "R//a"},
    {"R", "", "R//"},
    {"", "w.ext", "/w/w.ext"},
};

INSTANTIATE_TEST_SUITE_P(Table, WorkspacePath, ::testing::ValuesIn(kPathCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

TEST(TransformationRequest, PathFormTakesThePathAsGiven)
{
    ZELServerTransformationRequest request(str("S"), str("any/thing here.fmw"));
    EXPECT_EQ(request.workspacePath(), "any/thing here.fmw");
    EXPECT_EQ(requestText(request), textFor("any/thing here.fmw", ""));
}

// ---- Request text -------------------------------------------------------------------------------------

TEST(TransformationRequest, WithoutParametersTheTextIsPathAndEmptyDocument)
{
    ZELServerTransformationRequest request(str("S"), str("R"), str("w.ext"));
    EXPECT_EQ(requestText(request), "R/w/w.ext -XML_PARAMETER "s + kDeclaration + "<TRANSFORMATION_REQUEST/>");
}

TEST(TransformationRequest, ParametersInNameOrderThenEmbeddedDirectives)
{
    ZELServerTransformationRequest request(str("S"), str("R"), str("w.ext"));
    request.setEmbeddedDirective(str("LOG_LEVEL"), str("2"));
    request.setPublishedParameter(str("ZONE"), str("north"));
    request.setPublishedParameter(str("AREA"), str("a<b & c>d"));
    EXPECT_EQ(requestText(request),
              textFor("R/w/w.ext", R"(<PUBLISHED_PARAMETER name="AREA">a&lt;b &amp; c&gt;d</PUBLISHED_PARAMETER>)"
                                   R"(<PUBLISHED_PARAMETER name="ZONE">north</PUBLISHED_PARAMETER>)"
                                   R"(<ZEL_DIRECTIVE name="LOG_LEVEL">2</ZEL_DIRECTIVE>)"));
}

TEST(TransformationRequest, ParameterSetTwiceKeepsTheSecondValue)
{
    ZELServerTransformationRequest request(str("S"), str("R"), str("w.ext"));
    request.setPublishedParameter(str("P"), str("first"));
    request.setPublishedParameter(str("P"), str("second"));
    EXPECT_EQ(requestText(request), textFor("R/w/w.ext", R"(<PUBLISHED_PARAMETER name="P">second</PUBLISHED_PARAMETER>)"));
}

TEST(TransformationRequest, AttributeQuotesAreEscaped)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    request.setPublishedParameter(str("a\"b"), str(""));
    const std::string text = requestText(request);
    EXPECT_NE(text.find(R"(name="a&quot;b")"), std::string::npos) << text;
}

TEST(TransformationRequest, LocalCodePageTextBecomesUtf8)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    request.setPublishedParameter(str("CITY"), str("Z\xFCrich"));
    EXPECT_EQ(requestText(request), textFor("p", "<PUBLISHED_PARAMETER name=\"CITY\">Z\xC3\xBCrich</PUBLISHED_PARAMETER>"));
}

TEST(TransformationRequest, TextThatCannotBeWrittenLeavesOutUntouchedAndStaysDirty)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    request.setPublishedParameter(str("P"), str("a\0b"s));
    ZELServerString out("before");
    request.getRequestText(out);
    EXPECT_EQ(out.str(), "before");
    EXPECT_TRUE(request.dirty());

    // Once the value is fixed the next call composes it.
    request.setPublishedParameter(str("P"), str("ab"));
    EXPECT_EQ(requestText(request), textFor("p", R"(<PUBLISHED_PARAMETER name="P">ab</PUBLISHED_PARAMETER>)"));
    EXPECT_FALSE(request.dirty());
}

TEST(TransformationRequest, XmlSupportThatCannotBeMadeIsTriedAgain)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    heap::failNextAllocations(1);
    ZELServerString out("before");
    request.getRequestText(out);
    EXPECT_EQ(out.str(), "before");
    EXPECT_TRUE(request.dirty());
    EXPECT_EQ(requestText(request), textFor("p", ""));
}

// ---- Dirty flag ---------------------------------------------------------------------------------------

TEST(TransformationRequest, EmbeddedDirectivesDoNotRecomposeUntilKeywordIsSetAgain)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    EXPECT_TRUE(request.dirty());
    const std::string first = requestText(request);
    EXPECT_FALSE(request.dirty());

    request.setEmbeddedDirective(str("D"), str("1"));
    request.setEmbeddedDirectives(ZELServerStringArray(std::vector<std::string>{"E", "2"}));
    EXPECT_FALSE(request.dirty());
    EXPECT_EQ(requestText(request), first);

    request.setKeyword(str("S"));
    EXPECT_TRUE(request.dirty());
    EXPECT_EQ(requestText(request), textFor("p", R"(<ZEL_DIRECTIVE name="D">1</ZEL_DIRECTIVE>)"
                                                 R"(<ZEL_DIRECTIVE name="E">2</ZEL_DIRECTIVE>)"));
}

struct DirtyCase {
    const char* what;
    void (*change)(ZELServerTransformationRequest&);
    bool dirty;
};

class DirtyFlag : public ::testing::TestWithParam<DirtyCase> {};

TEST_P(DirtyFlag, OnlyKeywordAndPublishedParametersSetIt)
{
    ZELServerTransformationRequest request(str("S"), str("p"));
    requestText(request);
    ASSERT_FALSE(request.dirty());
    GetParam().change(request);
    EXPECT_EQ(request.dirty(), GetParam().dirty) << GetParam().what;
}

const DirtyCase kDirtyCases[] = {
    {"keyword", [](ZELServerTransformationRequest& r) { r.setKeyword(str("other")); }, true},
    {"one parameter", [](ZELServerTransformationRequest& r) { r.setPublishedParameter(str("P"), str("1")); }, true},
    {"parameter list", [](ZELServerTransformationRequest& r) { r.setPublishedParameters(ZELServerStringArray()); }, true},
    {"directive", [](ZELServerTransformationRequest& r) { r.setDirective(str("D"), str("1")); }, false},
    {"directive list",
     [](ZELServerTransformationRequest& r) { r.setDirectives(ZELServerStringArray(std::vector<std::string>{"D", "1"})); },
     false},
    {"embedded directive", [](ZELServerTransformationRequest& r) { r.setEmbeddedDirective(str("E"), str("1")); }, false},
    {"notification", [](ZELServerTransformationRequest& r) { r.setNotification(str("T"), str("m")); }, false},
    {"notification list",
     [](ZELServerTransformationRequest& r) {
         r.setNotifications(ZELServerStringArray(std::vector<std::string>{"T", "m"}));
     },
     false},
};

INSTANTIATE_TEST_SUITE_P(Table, DirtyFlag, ::testing::ValuesIn(kDirtyCases),
                         [](const auto& info) { return "case" + std::to_string(info.index); });

// ---- Dictionaries -------------------------------------------------------------------------------------

TEST(TransformationRequest, KeywordIsKeptWithItsBytes)
{
    ZELServerTransformationRequest request(str(" svc "), str("p"));
    ZELServerString keyword;
    request.getKeyword(keyword);
    EXPECT_EQ(keyword.str(), " svc ");
    request.setKeyword(str("a\0b"s));
    request.getKeyword(keyword);
    EXPECT_EQ(keyword.str(), "a\0b"s);
}

using SetAll = void (ZELServerTransformationRequest::*)(const IZELServerStringArray&);
using SetOne = void (ZELServerTransformationRequest::*)(const IZELServerString&, const IZELServerString&);
using GetOne = unsigned (ZELServerTransformationRequest::*)(const IZELServerString&, IZELServerString&) const;
using GetAll = void (ZELServerTransformationRequest::*)(IZELServerStringArray&) const;

struct Dictionary {
    const char* what;
    SetOne setOne;
    SetAll setAll;
    GetOne getOne;
    GetAll getAll;
};

class RequestDictionary : public ::testing::TestWithParam<Dictionary> {};

TEST_P(RequestDictionary, PairsReplaceByNameAndComeOutInNameOrder)
{
    const Dictionary& d = GetParam();
    ZELServerTransformationRequest request(str("S"), str("p"));
    (request.*d.setAll)(ZELServerStringArray(std::vector<std::string>{"b", "1", "a", "2", "b", "3", "odd"}));
    (request.*d.setOne)(str("c"), str("4"));
    (request.*d.setOne)(str("a"), str("5"));

    ZELServerStringArray all(std::vector<std::string>{"kept"});
    (request.*d.getAll)(all);
    EXPECT_EQ(all.items(), (std::vector<std::string>{"kept", "a", "5", "b", "3", "c", "4"})) << d.what;

    ZELServerString value("untouched");
    EXPECT_EQ((request.*d.getOne)(str("b"), value), 1u) << d.what;
    EXPECT_EQ(value.str(), "3") << d.what;
    value.assign("untouched");
    EXPECT_EQ((request.*d.getOne)(str("odd"), value), 0u) << d.what;
    EXPECT_EQ(value.str(), "untouched") << d.what;
}

TEST_P(RequestDictionary, DictionariesAreSeparate)
{
    const Dictionary& d = GetParam();
    ZELServerTransformationRequest request(str("S"), str("p"));
    (request.*d.setOne)(str("only"), str("here"));
    const Dictionary all[] = {
        {"published", &ZELServerTransformationRequest::setPublishedParameter, nullptr,
         &ZELServerTransformationRequest::getPublishedParameter, &ZELServerTransformationRequest::getPublishedParameters},
        {"directives", &ZELServerTransformationRequest::setDirective, nullptr,
         &ZELServerTransformationRequest::getDirective, &ZELServerTransformationRequest::getDirectives},
        {"embedded", &ZELServerTransformationRequest::setEmbeddedDirective, nullptr,
         &ZELServerTransformationRequest::getEmbeddedDirective, &ZELServerTransformationRequest::getEmbeddedDirectives},
        {"notifications", &ZELServerTransformationRequest::setNotification, nullptr,
         &ZELServerTransformationRequest::getNotification, &ZELServerTransformationRequest::getNotifications},
    };
    for (const Dictionary& other : all) {
        ZELServerStringArray pairs;
        (request.*other.getAll)(pairs);
        EXPECT_EQ(pairs.entries(), other.getAll == d.getAll ? 2u : 0u) << d.what << " seen in " << other.what;
    }
}

const Dictionary kDictionaries[] = {
    {"published", &ZELServerTransformationRequest::setPublishedParameter,
     &ZELServerTransformationRequest::setPublishedParameters, &ZELServerTransformationRequest::getPublishedParameter,
     &ZELServerTransformationRequest::getPublishedParameters},
    {"directives", &ZELServerTransformationRequest::setDirective, &ZELServerTransformationRequest::setDirectives,
     &ZELServerTransformationRequest::getDirective, &ZELServerTransformationRequest::getDirectives},
    {"embedded", &ZELServerTransformationRequest::setEmbeddedDirective,
     &ZELServerTransformationRequest::setEmbeddedDirectives, &ZELServerTransformationRequest::getEmbeddedDirective,
     &ZELServerTransformationRequest::getEmbeddedDirectives},
    {"notifications", &ZELServerTransformationRequest::setNotification,
     &ZELServerTransformationRequest::setNotifications, &ZELServerTransformationRequest::getNotification,
     &ZELServerTransformationRequest::getNotifications},
};

INSTANTIATE_TEST_SUITE_P(Table, RequestDictionary, ::testing::ValuesIn(kDictionaries),
                         [](const auto& info) { return std::string(info.param.what); });

// ---- Factories ----------------------------------------------------------------------------------------

TEST(TransformationRequestFactory, ThreeFormsMakeTheirPaths)
{
    std::unique_ptr<IZELServerTransformationRequest> byName(
        makeTransformationRequest(str("S"), str("R"), str("w.ext")));
    std::unique_ptr<IZELServerTransformationRequest> byPath(makeTransformationRequest(str("S"), str("R/x/y")));
    std::unique_ptr<IZELServerTransformationRequest> byObject(
        makeTransformationRequest(str("S"), str("R"), NamedWorkspace("v.ext")));
    ASSERT_TRUE(byName && byPath && byObject);
    EXPECT_EQ(requestText(*byName), textFor("R/w/w.ext", ""));
    EXPECT_EQ(requestText(*byPath), textFor("R/x/y", ""));
    EXPECT_EQ(requestText(*byObject), textFor("R/v/v.ext", ""));
    ZELServerString keyword;
    byObject->getKeyword(keyword);
    EXPECT_EQ(keyword.str(), "S");
}

TEST(TransformationRequestFactory, ExhaustedHeapGivesNull)
{
    heap::failNextAllocations(1);
    EXPECT_EQ(makeTransformationRequest(str("S"), str("R/x/y")), nullptr);
}

}  // namespace
}  // namespace zel
