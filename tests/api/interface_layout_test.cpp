// Slot positions of the public interfaces. A client calls every operation through its position in the
// virtual table, so a declaration moved in a header (an overload put next to its namesake, a getter
// slipped in front of the destructor) breaks clients that still compile without a murmur.
//
// Positions are read from pointers to member functions, whose bytes the Itanium C++ ABI defines: for
// a virtual function they hold the byte offset of its table entry, marked as virtual by a set low bit
// (on ARM the mark sits in the adjustment word and the offset is stored as it is). Nothing is ever
// called through a table. The ABI gives a virtual destructor two entries (complete and deleting)
// where our slot numbering counts one, so every slot behind the destructor sits one entry further on,
// and an interface of n slots fills n + 1 entries.

#include <gtest/gtest.h>

#include <zelserverapi/interfaces.h>

#include <cstddef>
#include <cstring>
#include <initializer_list>

#if defined(_MSC_VER)

TEST(InterfaceLayout, NeedsTheItaniumAbi) { GTEST_SKIP() << "member function pointers are read the Itanium way only"; }

#else

namespace {

struct MemberFunctionBits {
    std::ptrdiff_t ptr;
    std::ptrdiff_t adj;
};

constexpr std::ptrdiff_t kEntrySize = sizeof(void*);

// The table entry a virtual member function occupies, or -1 when the pointer is not virtual.
template <class Signature, class Interface>
long entryOf(Signature Interface::*member)
{
    static_assert(sizeof member == sizeof(MemberFunctionBits), "not an Itanium member function pointer");
    MemberFunctionBits bits;
    std::memcpy(&bits, &member, sizeof bits);
#if defined(__arm__) || defined(__aarch64__)
    if ((bits.adj & 1) == 0)
        return -1;
    return static_cast<long>(bits.ptr / kEntrySize);
#else
    if ((bits.ptr & 1) == 0)
        return -1;
    return static_cast<long>((bits.ptr - 1) / kEntrySize);
#endif
}

// The first virtual function a derived class adds lands right behind all of the interface's entries.
template <class Interface>
struct Extended : Interface {
    virtual void addedBehindTheInterface() = 0;
};

template <class Interface>
long entryCount()
{
    return entryOf(&Extended<Interface>::addedBehindTheInterface);
}

struct SlotCase {
    const char* operation;
    long entry;
    int slot;
};

void expectSlots(const char* interface, int destructorSlot, std::initializer_list<SlotCase> cases)
{
    for (const SlotCase& c : cases) {
        const long expected = c.slot < destructorSlot ? c.slot : c.slot + 1;
        EXPECT_EQ(c.entry, expected) << interface << "::" << c.operation << " must be slot " << c.slot;
    }
}

}  // namespace

// One operation by name, or one overload by its exact signature.
#define SLOT(I, name, n)                                                                                               \
    SlotCase { #name, entryOf(&I::name), n }
#define OVERLOAD(I, name, signature, n)                                                                                \
    SlotCase { #name " " #signature, entryOf<signature>(&I::name), n }
#define COUNT(I, n)                                                                                                    \
    Count { #I, entryCount<I>(), n }

TEST(InterfaceLayout, EveryInterfaceHasItsNumberOfSlots)
{
    struct Count {
        const char* interface;
        long entries;
        int slots;
    };
    const Count counts[] = {
        COUNT(IZELServerString, 7),
        COUNT(IZELServerStringArray, 14),
        COUNT(IZELServerVector<IZELServerItem>, 8),
        COUNT(IZELServerStatus, 4),
        COUNT(IZELServerConnectionInfo, 10),
        COUNT(IZELServerIdentity, 5),
        COUNT(IZELServerSingleSignOnIdentity, 3),
        COUNT(IZELServerProgressListener, 5),
        COUNT(IZELServerSession, 79),
        COUNT(IZELServerBaseTransformationManager, 3),
        COUNT(IZELServerTransformationManager, 14),
        COUNT(IZELServerTransformationRequest, 20),
        COUNT(IZELServerTransformationResult, 36),
        COUNT(IZELServerLogFileInfo, 2),
        COUNT(IZELServerRepositoryManager, 13),
        COUNT(IZELServerRepository, 34),
        COUNT(IZELServerWorkspace, 14),
        COUNT(IZELServerWorkspaceSummary, 5),
        COUNT(IZELServerDataset, 8),
        COUNT(IZELServerFeatureType, 6),
        COUNT(IZELServerAttribute, 5),
        COUNT(IZELServerParameter, 8),
        COUNT(IZELServerItem, 16),
        COUNT(IZELServerCustomFormat, 6),
        COUNT(IZELServerCustomTransformer, 6),
        COUNT(IZELServerTemplate, 6),
        COUNT(IZELServerResource, 4),
        COUNT(IZELServerService, 21),
        COUNT(IZELServerWorkspaceService, 3),
        COUNT(IZELServerPropertyAccessor, 10),
        COUNT(IZELServerProperty, 6),
        COUNT(IZELServerSecurityManager, 10),
        COUNT(IZELServerUserToken, 4),
        COUNT(IZELServerMountPointManager, 3),
        COUNT(IZELServerMountPoint, 20),
        COUNT(IZELServerFileInfo, 5),
        COUNT(IZELServerPath, 4),
    };
    for (const Count& c : counts)
        EXPECT_EQ(c.entries, c.slots + 1) << c.interface << " must have " << c.slots << " slots";
}

TEST(InterfaceLayout, ValueOverloadsKeepTheirSlots)
{
    using A = IZELServerStringArray;
    expectSlots("IZELServerStringArray", 13,
                {
                    OVERLOAD(A, append, void(const IZELServerString&), 0),
                    OVERLOAD(A, append, void(const char*), 1),
                    OVERLOAD(A, contains, bool(const IZELServerString&) const, 7),
                    OVERLOAD(A, contains, bool(const char*) const, 8),
                    OVERLOAD(A, removeAll, unsigned(const IZELServerString&), 11),
                    OVERLOAD(A, removeAll, unsigned(const char*), 12),
                });
    expectSlots("IZELServerIdentity", 3,
                {
                    SLOT(IZELServerIdentity, isAuthenticated, 2),
                    SLOT(IZELServerIdentity, readFromXml, 4),
                });
}

TEST(InterfaceLayout, SessionFactoryOverloadsKeepTheirSlots)
{
    using S = IZELServerSession;
    using Str = const IZELServerString&;
    expectSlots(
        "IZELServerSession", 78,
        {
            SLOT(S, init, 0),
            OVERLOAD(S, createConnectionInfo, IZELServerConnectionInfo * (Str, const IZELServerStringArray&), 1),
            OVERLOAD(S, createConnectionInfo, IZELServerConnectionInfo * (Str, Str, Str), 2),
            OVERLOAD(S, createConnectionInfo,
                     IZELServerConnectionInfo * (Str, unsigned short, const IZELServerStringArray&), 3),
            OVERLOAD(S, createConnectionInfo, IZELServerConnectionInfo * (Str, unsigned short, Str, Str), 4),
            OVERLOAD(S, createTransformationRequest,
                     IZELServerTransformationRequest * (Str, Str, const IZELServerWorkspace&), 13),
            OVERLOAD(S, createTransformationRequest, IZELServerTransformationRequest * (Str, Str, Str), 14),
            OVERLOAD(S, createTransformationRequest, IZELServerTransformationRequest * (Str, Str), 15),
            OVERLOAD(S, createTransformationResult, IZELServerTransformationResult * (Str), 17),
            OVERLOAD(S, createTransformationResult, IZELServerTransformationResult * (), 18),
            OVERLOAD(S, createService, IZELServerService * (Str, Str, Str, Str), 20),
            OVERLOAD(S, createService, IZELServerService * (), 21),
            SLOT(S, getSessionProperty, 60),
            SLOT(S, destroyFileInfoVector, 77),
        });
}

TEST(InterfaceLayout, TransformationManagerSlots)
{
    using B = IZELServerBaseTransformationManager;
    expectSlots("IZELServerBaseTransformationManager", 2,
                {
                    SLOT(B, transactJob, 0),
                    SLOT(B, transactJobString, 1),
                });
    using M = IZELServerTransformationManager;
    expectSlots("IZELServerTransformationManager", 12,
                {
                    SLOT(M, transactJob, 0),
                    SLOT(M, transactJobString, 1),
                    SLOT(M, submitJob, 2),
                    SLOT(M, submitJobString, 3),
                    SLOT(M, scheduleJob, 4),
                    SLOT(M, scheduleJobString, 5),
                    SLOT(M, abortJob, 6),
                    SLOT(M, getJobResult, 7),
                    SLOT(M, getJobResultString, 8),
                    SLOT(M, logFileExists, 9),
                    SLOT(M, getLogFileInfo, 10),
                    SLOT(M, getLogFile, 11),
                    SLOT(M, reserved, 13),
                });
}

TEST(InterfaceLayout, TransformationRequestSlots)
{
    using R = IZELServerTransformationRequest;
    expectSlots("IZELServerTransformationRequest", 19,
                {
                    SLOT(R, setKeyword, 0),
                    SLOT(R, getPublishedParameters, 5),
                    SLOT(R, setDirective, 6),
                    SLOT(R, getEmbeddedDirectives, 13),
                    SLOT(R, getRequestText, 14),
                    SLOT(R, setNotification, 15),
                    SLOT(R, getNotifications, 18),
                });
}

TEST(InterfaceLayout, TransformationResultOverloadsStraddleTheDestructor)
{
    using R = IZELServerTransformationResult;
    using Name = const IZELServerString&;
    using Raw = const std::string&;
    expectSlots("IZELServerTransformationResult", 25,
                {
                    SLOT(R, getText, 0),
                    SLOT(R, getJobStatus, 3),
                    SLOT(R, isSuccess, 4),
                    SLOT(R, getDescription, 16),
                    SLOT(R, getStatusNumber, 17),
                    SLOT(R, getPropertyNames, 19),
                    SLOT(R, getProperties, 20),
                    OVERLOAD(R, getStringProperty, unsigned(Name, IZELServerString&) const, 21),
                    OVERLOAD(R, getFloatProperty, unsigned(Name, float&) const, 22),
                    OVERLOAD(R, getUIntProperty, unsigned(Name, unsigned&) const, 23),
                    OVERLOAD(R, getBoolProperty, unsigned(Name, unsigned&) const, 24),
                    SLOT(R, lookupProperty, 26),
                    OVERLOAD(R, getStringProperty, unsigned(Raw, IZELServerString&) const, 27),
                    OVERLOAD(R, getFloatProperty, unsigned(Raw, float&) const, 28),
                    SLOT(R, getUIntPropertyAnyBase, 29),
                    OVERLOAD(R, getUIntProperty, unsigned(Raw, unsigned&) const, 30),
                    OVERLOAD(R, getBoolProperty, unsigned(Raw, unsigned&) const, 31),
                    SLOT(R, parse, 32),
                    SLOT(R, parseProperties, 33),
                    SLOT(R, parseResultValue, 34),
                    SLOT(R, findProperty, 35),
                });
}

TEST(InterfaceLayout, RepositoryTransferOverloadsKeepTheirSlots)
{
    using R = IZELServerRepository;
    using Str = const IZELServerString&;
    using Listener = IZELServerProgressListener*;
    expectSlots("IZELServerRepository", 33,
                {
                    SLOT(R, getName, 0),
                    SLOT(R, getDescription, 1),
                    SLOT(R, itemExists, 2),
                    OVERLOAD(R, getItem, IZELServerStatus * (Str, Str, unsigned&, Listener), 3),
                    OVERLOAD(R, getItem, IZELServerStatus * (Str, Str, unsigned&), 4),
                    OVERLOAD(R, addItem, IZELServerStatus * (Str, Str, Listener), 5),
                    OVERLOAD(R, addItem, IZELServerStatus * (Str, Str), 6),
                    OVERLOAD(R, updateItem, IZELServerStatus * (Str, Str, Listener), 7),
                    OVERLOAD(R, updateItem, IZELServerStatus * (Str, Str), 8),
                    SLOT(R, removeItem, 9),
                    SLOT(R, itemResourceExists, 10),
                    OVERLOAD(R, getItemResource, IZELServerStatus * (Str, Str, Str, unsigned&, Listener), 11),
                    SLOT(R, getItemResourceView, 12),
                    OVERLOAD(R, getItemResource, IZELServerStatus * (Str, Str, Str, unsigned&), 13),
                    OVERLOAD(R, addItemResource, IZELServerStatus * (Str, Str, Str, Listener), 14),
                    OVERLOAD(R, addItemResource, IZELServerStatus * (Str, Str, Str), 15),
                    OVERLOAD(R, updateItemResource, IZELServerStatus * (Str, Str, Str, Listener), 16),
                    OVERLOAD(R, updateItemResource, IZELServerStatus * (Str, Str, Str), 17),
                    SLOT(R, removeItemResource, 18),
                    SLOT(R, getWorkspaceSummariesView, 19),
                    SLOT(R, getWorkspacesView, 20),
                    SLOT(R, getWorkspaceView, 21),
                    SLOT(R, getCustomFormatsView, 22),
                    SLOT(R, getCustomFormatView, 23),
                    SLOT(R, getCustomTransformersView, 24),
                    SLOT(R, getCustomTransformerView, 25),
                    SLOT(R, getItemResourcesView, 26),
                    SLOT(R, getWorkspaceServices, 27),
                    SLOT(R, workspaceServiceExists, 28),
                    SLOT(R, registerWorkspaceService, 29),
                    SLOT(R, deregisterWorkspaceService, 30),
                    SLOT(R, getTemplatesView, 31),
                    SLOT(R, getTemplateView, 32),
                });
}

TEST(InterfaceLayout, RepositoryManagerAndServiceSlots)
{
    using M = IZELServerRepositoryManager;
    expectSlots("IZELServerRepositoryManager", 12,
                {
                    SLOT(M, serviceExists, 0),
                    SLOT(M, getServices, 1),
                    SLOT(M, updateService, 4),
                    SLOT(M, repositoryExists, 6),
                    SLOT(M, getRepositories, 7),
                    SLOT(M, addRepository, 9),
                    SLOT(M, getGlobalItems, 11),
                });
    using S = IZELServerService;
    expectSlots("IZELServerService", 20,
                {
                    SLOT(S, setName, 1),
                    SLOT(S, isEnabled, 8),
                    SLOT(S, getPropertyAccessor, 10),
                    SLOT(S, updatePropertyAccessor, 11),
                    SLOT(S, isWorkspaceRegistrationAllowed, 12),
                    SLOT(S, isRegistrationAllowed, 14),
                    SLOT(S, setRegistrationAllowed, 15),
                    SLOT(S, itemRegistered, 16),
                    SLOT(S, getRegisteredItems, 19),
                });
    expectSlots("IZELServerWorkspaceService", 2,
                {
                    SLOT(IZELServerWorkspaceService, getWorkspaceSummary, 0),
                    SLOT(IZELServerWorkspaceService, getService, 1),
                });
}

TEST(InterfaceLayout, ObjectModelGettersKeepTheirSlots)
{
    using W = IZELServerWorkspace;
    expectSlots("IZELServerWorkspace", 13,
                {
                    SLOT(W, isEnabled, 3),
                    SLOT(W, getParameters, 4),
                    SLOT(W, getDestinationFeatureTypes, 8),
                    SLOT(W, getPropertyAccessor, 9),
                    SLOT(W, getResources, 10),
                    SLOT(W, updatePropertyAccessor, 11),
                    SLOT(W, getFileSize, 12),
                });
    expectSlots("IZELServerDataset", 7,
                {
                    SLOT(IZELServerDataset, getFeatureTypes, 1),
                    SLOT(IZELServerDataset, getFormat, 2),
                    SLOT(IZELServerDataset, isSource, 4),
                    SLOT(IZELServerDataset, updatePropertyAccessor, 6),
                });
    expectSlots("IZELServerFeatureType", 5,
                {
                    SLOT(IZELServerFeatureType, getAttributes, 2),
                    SLOT(IZELServerFeatureType, updatePropertyAccessor, 4),
                });
    expectSlots("IZELServerParameter", 7,
                {
                    SLOT(IZELServerParameter, getDefaultValue, 2),
                    SLOT(IZELServerParameter, getOptions, 4),
                    SLOT(IZELServerParameter, getOptionsType, 6),
                });
    expectSlots("IZELServerItem", 15,
                {
                    SLOT(IZELServerItem, getItemType, 2),
                    SLOT(IZELServerItem, getFileSize, 5),
                    SLOT(IZELServerItem, getBuildNumber, 13),
                    SLOT(IZELServerItem, getLegalTermsAndConditions, 14),
                });
    // Custom formats, custom transformers and templates share one layout: the title comes after the size.
    expectSlots("IZELServerCustomFormat", 5,
                {
                    SLOT(IZELServerCustomFormat, getFileSize, 2),
                    SLOT(IZELServerCustomFormat, getTitle, 3),
                    SLOT(IZELServerCustomFormat, getItemType, 4),
                });
    expectSlots("IZELServerCustomTransformer", 5,
                {
                    SLOT(IZELServerCustomTransformer, getFileSize, 2),
                    SLOT(IZELServerCustomTransformer, getTitle, 3),
                    SLOT(IZELServerCustomTransformer, getItemType, 4),
                });
    expectSlots("IZELServerTemplate", 5,
                {
                    SLOT(IZELServerTemplate, getFileSize, 2),
                    SLOT(IZELServerTemplate, getTitle, 3),
                    SLOT(IZELServerTemplate, getItemType, 4),
                });
    using P = IZELServerPropertyAccessor;
    expectSlots("IZELServerPropertyAccessor", 9,
                {
                    SLOT(P, getPropertyNames, 1),
                    SLOT(P, getPropertyPairs, 2),
                    SLOT(P, getPropertyValue, 3),
                    SLOT(P, setProperty, 4),
                    SLOT(P, getProperties, 7),
                    SLOT(P, getProperty, 8),
                });
}

TEST(InterfaceLayout, SecurityManagerFactoryOverloadsKeepTheirSlots)
{
    using M = IZELServerSecurityManager;
    using Str = const IZELServerString&;
    expectSlots("IZELServerSecurityManager", 9,
                {
                    SLOT(M, userTokenExists, 0),
                    OVERLOAD(M, createUserToken, IZELServerUserToken * (Str, Str, long long), 1),
                    OVERLOAD(M, createUserToken, IZELServerUserToken * (), 2),
                    SLOT(M, destroyUserToken, 3),
                    SLOT(M, getUserToken, 4),
                    SLOT(M, addUserToken, 5),
                    SLOT(M, updateUserToken, 6),
                    SLOT(M, removeUserToken, 7),
                    SLOT(M, userTokenExpired, 8),
                });
    expectSlots("IZELServerUserToken", 3,
                {
                    SLOT(IZELServerUserToken, getExpirationTimeout, 2),
                });
}

TEST(InterfaceLayout, MountPointSlotsIncludingTheOneBehindTheDestructor)
{
    using M = IZELServerMountPoint;
    using Path = const IZELServerPath&;
    using Str = const IZELServerString&;
    expectSlots("IZELServerMountPoint", 18,
                {
                    SLOT(M, getName, 0),
                    SLOT(M, getDescription, 2),
                    SLOT(M, exists, 3),
                    SLOT(M, download, 4),
                    SLOT(M, upload, 5),
                    SLOT(M, copy, 6),
                    SLOT(M, move, 7),
                    OVERLOAD(M, getFileInfo, IZELServerStatus * (Path, unsigned, IZELServerFileInfo&), 8),
                    OVERLOAD(M, getFileInfo, IZELServerStatus * (Path, IZELServerFileInfo&), 9),
                    OVERLOAD(M, list, IZELServerStatus * (Path, unsigned, IZELServerVector<IZELServerFileInfo>&), 10),
                    OVERLOAD(M, list, IZELServerStatus * (Path, IZELServerVector<IZELServerFileInfo>&), 11),
                    SLOT(M, makeDirectory, 12),
                    SLOT(M, remove, 13),
                    SLOT(M, reserved, 14),
                    OVERLOAD(M, createPath, IZELServerPath * (Str), 15),
                    OVERLOAD(M, createPath, IZELServerPath * (Str, Str), 16),
                    SLOT(M, releaseObject, 17),
                    SLOT(M, readFromXML, 19),
                });
    expectSlots("IZELServerMountPointManager", 2,
                {
                    SLOT(IZELServerMountPointManager, getSharedResources, 0),
                    SLOT(IZELServerMountPointManager, getSharedResource, 1),
                });
    expectSlots("IZELServerFileInfo", 4,
                {
                    SLOT(IZELServerFileInfo, getPath, 0),
                    SLOT(IZELServerFileInfo, getDate, 3),
                });
}

#endif
