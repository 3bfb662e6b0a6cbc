// Sources and clips on the reference scene: lists, the source of a path, the clips of a source,
// operators, folders, and every host call failed in turn.
#include <functional>
#include <iostream>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ut/host/reference_host.h>
#include <ut/scene.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/shaders.h>
#include <ut/sources.h>

#include "scene/test_scene.h"
#include "support/fault_plan.h"

namespace {

using ut::ComPtr;
using ut::test::Result;

constexpr GUID kOtherClip = {0x5C0E0001, 0, 0, {1, 1, 1, 1, 1, 1, 1, 1}};
constexpr GUID kBlur = {0x5C0E0002, 0, 0, {2, 2, 2, 2, 2, 2, 2, 2}};
constexpr GUID kBend = {0x5C0E0003, 0, 0, {3, 3, 3, 3, 3, 3, 3, 3}};
constexpr GUID kNone = {0x5C0E0004, 0, 0, {4, 4, 4, 4, 4, 4, 4, 4}};

// Two image sources of one file (written two ways), one without a file in front of a third, a
// hidden one, and a source of the other listed class; clips of the first two and of another class.
ut::host::Settings MediaScene() {
    using namespace ut::host;
    Settings settings;
    ObjectDescription arm{.name = L"Arm", .operators = {kBend, kBlur, kBend}};
    settings.scene.objects = {{.name = L"Robot", .model = true, .children = {arm}}, {.name = L"Light"}};
    settings.scene.sources = {{.name = L"plate", .path = L"C:\\plates\\a.pic"},
                              {.name = L"Plate copy", .path = L"c:/PLATES/A.PIC"},
                              {.name = L"blank"},
                              {.name = L"clean", .path = L"C:\\plates\\c.pic"},
                              {.name = L"secret", .path = L"C:\\h.pic", .hidden = true},
                              {.clsid = CLSID_3DListedSource, .name = L"Movie", .path = L"m.mov"}};
    settings.scene.clips = {{.name = L"plate clip", .source = L"plate"},
                            {.name = L"copy clip", .source = L"Plate copy", .hidden = true},
                            {.clsid = kOtherClip, .name = L"other clip", .source = L"plate"}};
    return settings;
}

std::wstring NameOf(IUnknown* object) {
    ComPtr<IGWNamedObject> named;
    wchar_t* text = nullptr;
    if (!object || FAILED(object->QueryInterface(IID_IGWNamedObject, named.PutVoid())) ||
        FAILED(named->GetName(&text)))
        return L"-";
    CKXString name;
    name.Attach_OLE(text);
    return name.Str();
}

// The names of a list's members, joined with "|".
std::wstring Names(I3DList* list) {
    std::wstring names;
    ULONG count = 0;
    if (!list || FAILED(list->GetCount(&count)))
        return L"-";
    for (ULONG i = 0; i < count; ++i) {
        ComPtr<I3DElemRef> element;
        ComPtr<IUnknown> target;
        if (SUCCEEDED(list->GetItem(i, element.Put())))
            (void)element->GetTarget(IID_IUnknown, target.PutVoid(), 1);
        names += (i ? L"|" : L"") + NameOf(target.Get());
    }
    return names;
}

class Sources : public ::testing::Test {
protected:
    ComPtr<IUnknown> Source(const wchar_t* path) {
        ComPtr<IUnknown> source;
        EXPECT_EQ(F3DFindSource(CLSID_3DImageSource, CKXString(path), IID_IUnknown, source.PutVoid()), S_OK);
        return source;
    }
    ComPtr<I3DObject> Object(const wchar_t* name) {
        std::wstring copy = name;
        ComPtr<I3DObject> object;
        EXPECT_EQ(F3DGet3DObjectFromName(copy.data(), object.Put()), S_OK);
        return object;
    }

    ut::host::ReferenceHost host_{MediaScene()};
};

TEST_F(Sources, ListsTheMembersOfAClassInTheContainersOrder) {
    struct Case {
        GUID key, classId;
        std::string result;
        std::wstring names;
    } cases[] = {
        {GUID_3DSourcesContainerKey, CLSID_3DImageSource, "S_OK", L"plate|Plate copy|blank|clean|secret"},
        {GUID_3DSourcesContainerKey, CLSID_3DListedSource, "S_OK", L"Movie"},
        {GUID_3DClipsContainerKey, CLSID_3DImageClip, "S_OK", L"plate clip|copy clip"},
        {GUID_3DClipsContainerKey, kOtherClip, "S_OK", L"other clip"},
        {GUID_3DClipsContainerKey, CLSID_3DImageSource, "S_FALSE", L""},
        // A content-container member that lists nothing of the kind cannot be asked.
        {GUID_3DDeviceManagerKey, CLSID_3DImageSource, "E_FAIL", L"-"},
        {kNone, CLSID_3DImageSource, "E_FAIL", L"-"},
    };
    for (const Case& c : cases) {
        ComPtr<I3DList> list;
        EXPECT_EQ(Result(F3DGetObjectsListFromContainer(c.key, c.classId, list.Put())), c.result);
        EXPECT_EQ(Names(list.Get()), c.names);
    }
    ComPtr<I3DList> list;
    EXPECT_EQ(F3DGetSourcesList(CLSID_3DListedSource, list.Put()), S_OK);
    EXPECT_EQ(F3DGetClipsList(kOtherClip, list.Put()), S_OK);
    EXPECT_EQ(Names(list.Get()), L"other clip");
    EXPECT_EQ(F3DGetSourcesList(CLSID_3DImageSource, nullptr), E_POINTER);
    ComPtr<I3DSourceClipContainer> sources, clips;
    EXPECT_EQ(F3DGetSourcesContainer(IID_I3DSourceClipContainer, sources.PutVoid()), S_OK);
    EXPECT_EQ(F3DGetClipsContainer(IID_I3DSourceClipContainer, clips.PutVoid()), S_OK);
    EXPECT_NE(sources.Get(), clips.Get());
    EXPECT_EQ(F3DGetClipsContainer(IID_I3DSourceClipContainer, nullptr), E_POINTER);
}

TEST_F(Sources, FindsTheSourceOfAPath) {
    struct Case {
        GUID sourceClass;
        const wchar_t* path;
        std::string result;
        std::wstring found, all;
        std::string allResult;
    } cases[] = {
        // The first of two equal paths wins; all of them are listed, in order.
        {CLSID_3DImageSource, L"C:/Plates/A.pic", "S_OK", L"plate", L"plate|Plate copy", "S_OK"},
        // A source without a file in front hides a match from the first search, not from the second.
        {CLSID_3DImageSource, L"C:\\plates\\c.pic", "S_FALSE", L"-", L"clean", "S_OK"},
        {CLSID_3DImageSource, L"C:\\h.pic", "S_FALSE", L"-", L"secret", "S_OK"},
        {CLSID_3DImageSource, L"", "S_FALSE", L"-", L"", "S_FALSE"},
        {CLSID_3DImageSource, L"C:\\plates\\a.pi", "S_FALSE", L"-", L"", "S_FALSE"},
        {CLSID_3DListedSource, L"M.MOV", "S_OK", L"Movie", L"Movie", "S_OK"},
        {kNone, L"m.mov", "S_FALSE", L"-", L"", "S_FALSE"},
    };
    for (const Case& c : cases) {
        ComPtr<IUnknown> found;
        ComPtr<I3DList> all;
        EXPECT_EQ(Result(F3DFindSource(c.sourceClass, CKXString(c.path), IID_IUnknown, found.PutVoid())),
                  c.result);
        EXPECT_EQ(NameOf(found.Get()), c.found);
        EXPECT_EQ(Result(F3DFindAllSources(c.sourceClass, CKXString(c.path), all.Put())), c.allResult);
        EXPECT_EQ(Names(all.Get()), c.all); // a list even when nothing is found
        if (IsEqualGUID(c.sourceClass, CLSID_3DImageSource)) {
            EXPECT_EQ(Result(F3DFindImageSource(c.path, IID_I3DSource, found.PutVoid())), c.result);
            EXPECT_EQ(NameOf(found.Get()), c.found);
        }
    }
    ComPtr<IUnknown> out;
    EXPECT_EQ(F3DFindSource(CLSID_3DImageSource, CKXString(L"C:\\plates\\a.pic"), IID_I3DClip, out.PutVoid()),
              E_FAIL); // a source is no clip
    EXPECT_FALSE(out);
    EXPECT_EQ(F3DFindSource(CLSID_3DImageSource, CKXString(L"x"), IID_IUnknown, nullptr), E_POINTER);
    EXPECT_EQ(F3DFindAllSources(CLSID_3DImageSource, CKXString(L"x"), nullptr), E_POINTER);
}

TEST_F(Sources, FindsTheClipOfASourceByIdentity) {
    ComPtr<IUnknown> plate = Source(L"C:\\plates\\a.pic");
    ComPtr<IUnknown> copy;
    ComPtr<I3DList> both;
    ASSERT_EQ(F3DFindAllSources(CLSID_3DImageSource, CKXString(L"C:\\plates\\a.pic"), both.Put()), S_OK);
    ComPtr<I3DElemRef> second;
    ASSERT_EQ(both->GetItem(1, second.Put()), S_OK);
    ASSERT_EQ(second->GetTarget(IID_IUnknown, copy.PutVoid(), 1), S_OK);
    ComPtr<I3DSource> plateAsSource;
    ASSERT_EQ(plate.As(plateAsSource), S_OK);
    struct Case {
        GUID clipClass;
        IUnknown* source;
        std::string result;
        std::wstring clip;
    } cases[] = {
        {CLSID_3DImageClip, plate.Get(), "S_OK", L"plate clip"},
        {CLSID_3DImageClip, copy.Get(), "S_OK", L"copy clip"}, // hidden from lists, not from a search
        {kOtherClip, plate.Get(), "S_OK", L"other clip"},
        {kOtherClip, copy.Get(), "S_FALSE", L"-"},
        // Another interface of the same source is not its identity.
        {CLSID_3DImageClip, plateAsSource.Get(), "S_FALSE", L"-"},
        {CLSID_3DImageClip, nullptr, "E_INVALIDARG", L"-"},
    };
    for (const Case& c : cases) {
        ComPtr<IUnknown> clip;
        EXPECT_EQ(Result(F3DFindClip(c.clipClass, c.source, IID_IUnknown, clip.PutVoid())), c.result);
        EXPECT_EQ(NameOf(clip.Get()), c.clip);
        if (IsEqualGUID(c.clipClass, CLSID_3DImageClip)) {
            EXPECT_EQ(Result(F3DFindImageClip(c.source, IID_I3DClip, clip.PutVoid())), c.result);
            EXPECT_EQ(NameOf(clip.Get()), c.clip);
        }
    }
    EXPECT_EQ(F3DFindClip(CLSID_3DImageClip, plate.Get(), IID_IUnknown, nullptr), E_POINTER);
}

TEST_F(Sources, FindsTheTopMostOperatorAndTheFolderOfAnAction) {
    ComPtr<I3DObject> arm = Object(L"Arm"), light = Object(L"Light"), robot = Object(L"Robot");
    ComPtr<IUnknown> plate = Source(L"C:\\plates\\a.pic");
    // The top of the stack is the first of its class: the two bends are told apart by identity.
    ComPtr<IGWActiveData> data;
    ComPtr<IGWEnumObjects> stack;
    ComPtr<IUnknown> top, blur;
    ASSERT_EQ(arm.As(data), S_OK);
    ASSERT_EQ(data->QueryObjects(GWQUERY_OPERATORS, 0, 0, GUID_NULL, IID_IPersist, stack.Put()), S_OK);
    ASSERT_EQ(stack->Next(top.Put()), S_OK);
    struct Case {
        IUnknown* object;
        GUID classId;
        std::string result;
        IUnknown* expected;
    } cases[] = {
        {arm.Get(), kBend, "S_OK", top.Get()},     {arm.Get(), kBlur, "S_OK", nullptr},
        {arm.Get(), kNone, "NOTFOUND", nullptr},   {light.Get(), kBend, "NOTFOUND", nullptr},
        {plate.Get(), kBend, "NOTFOUND", nullptr}, // active data without an operator stack
        {nullptr, kBend, "E_POINTER", nullptr},
    };
    for (const Case& c : cases) {
        ComPtr<IPersist> found;
        EXPECT_EQ(Result(F3DGetTopMostOp(c.object, 16, 4, c.classId, IID_IPersist, found.PutVoid())),
                  c.result);
        EXPECT_TRUE(!c.expected || static_cast<IUnknown*>(found.Get()) == c.expected);
        CLSID clsid = GUID_NULL;
        EXPECT_TRUE(!found || (SUCCEEDED(found->GetClassID(&clsid)) && IsEqualGUID(clsid, c.classId)));
    }
    ComPtr<I3DObject> folder;
    EXPECT_EQ(KXGetPrimaryFolderForAction(arm.Get(), IID_I3DObject, folder.PutVoid()), S_OK);
    EXPECT_EQ(folder.Get(), robot.Get());
    EXPECT_EQ(KXGetPrimaryFolderForAction(plate.Get(), IID_I3DObject, folder.PutVoid()), E_FAIL);
    EXPECT_FALSE(folder);
    EXPECT_EQ(KXGetPrimaryFolderForAction(nullptr, IID_I3DObject, folder.PutVoid()), E_FAIL);
}

TEST_F(Sources, MakesNameListsWithoutHiddenMembers) {
    using Entries = std::vector<std::pair<unsigned int, CKXString>>;
    auto text = [](const Entries& entries) {
        std::wstring joined;
        for (const auto& [index, name] : entries)
            joined += std::to_wstring(index) + L":" + name.Str() + L" ";
        return joined;
    };
    Entries entries = {{9, L"stale"}};
    EXPECT_EQ(F3DMakeSourceList(entries, false), S_OK);
    EXPECT_EQ(text(entries), L"0:plate 1:Plate copy 2:blank 3:clean 5:Movie ");
    EXPECT_EQ(F3DMakeSourceList(entries, true), S_OK);
    EXPECT_EQ(text(entries), L"2:blank 3:clean 5:Movie 0:plate 1:Plate copy ");
    EXPECT_EQ(F3DMakeClipList(entries, true), S_OK);
    EXPECT_EQ(text(entries), L"0:plate clip ");
}

TEST(SourcesEmpty, AnEmptySceneListsNothing) {
    ut::host::ReferenceHost host;
    std::vector<std::pair<unsigned int, CKXString>> entries = {{1, L"stale"}};
    EXPECT_EQ(F3DMakeClipList(entries, false), S_FALSE);
    EXPECT_TRUE(entries.empty());
    EXPECT_EQ(F3DMakeSourceList(entries, true), S_FALSE);
    ComPtr<I3DList> list;
    EXPECT_EQ(F3DGetSourcesList(CLSID_3DImageSource, list.Put()), S_FALSE);
    EXPECT_EQ(Names(list.Get()), L"");
}

TEST(SourcesDescription, ReadsAndWritesSourcesClipsAndOperators) {
    const std::string json =
        R"({"name": "S", "objects": [{"name": "A", "operators": ["{5C0E0002-0000-0000-0202-020202020202}"]}],
        "sources": [{"name": "p", "path": "C:\\a.pic", "hidden": true},
                    {"class": "{C38D4853-1911-42E2-8168-F9F758626E8F}", "name": "m"}],
        "clips": [{"name": "c", "source": "p"}]})";
    ut::host::SceneDescription scene;
    std::string error;
    ASSERT_EQ(ut::host::ParseSceneDescription(json, scene, error), S_OK) << error;
    ASSERT_EQ(scene.sources.size(), 2u);
    EXPECT_TRUE(scene.sources[0].hidden && IsEqualGUID(scene.sources[1].clsid, CLSID_3DListedSource));
    EXPECT_EQ(scene.clips[0].source, L"p");
    EXPECT_TRUE(IsEqualGUID(scene.objects[0].operators.at(0), kBlur));
    ut::host::ReferenceHost host(ut::host::Settings{.scene = scene});
    ut::host::SceneDescription back;
    ASSERT_EQ(
        ut::host::ParseSceneDescription(ut::host::FormatSceneDescription(host.DescribeScene()), back, error),
        S_OK);
    EXPECT_EQ(ut::host::FormatSceneDescription(back), ut::host::FormatSceneDescription(scene));
    const std::pair<std::string, std::string> refused[] = {
        {R"({"sources": [{"pat": "x"}]})", "sources[0].pat: unknown key"},
        {R"({"clips": [{"source": 1}]})", "clips[0].source: expected a string"},
        {R"({"objects": [{"operators": ["x"]}]})", "objects[0].operators[0]: expected a GUID"},
    };
    for (const auto& [text, message] : refused) {
        EXPECT_EQ(ut::host::ParseSceneDescription(text, scene, error), E_INVALIDARG);
        EXPECT_EQ(error.rfind(message, 0), 0u) << error;
    }
}

// Every export with its 1st, 2nd, ... host call failing: a documented answer, the out-parameter
// null on a failure (the list of F3DFindAllSources excepted), and nothing left alive.
TEST_F(Sources, EveryExportSurvivesEveryHostFault) {
    ComPtr<IUnknown> plate = Source(L"C:\\plates\\a.pic");
    ComPtr<I3DObject> arm = Object(L"Arm");
    std::vector<std::pair<unsigned int, CKXString>> entries;
    const CKXString platePath(L"C:\\plates\\a.pic"), cleanPath(L"C:\\plates\\c.pic");
    struct Walk {
        const char* name;
        std::function<std::pair<HRESULT, IUnknown*>()> run;
        std::set<std::string> answers; // what a failing host call may give
    };
    auto handing = [](auto call) {
        return [call] {
            IUnknown* out = nullptr;
            HRESULT hr = call(reinterpret_cast<void**>(&out));
            return std::pair(hr, out);
        };
    };
    // A failing call that a walk passes over by design (a member whose class cannot be read is
    // not of the class; a missing container is made anew) leaves the answer a success.
    const std::set<std::string> failOrNone = {"E_FAIL", "S_FALSE", "S_OK"};
    IUnknown* const nothing = nullptr;
    // clang-format off
    const Walk walks[] = {
        {"sources container", handing([](void** out) { return F3DGetSourcesContainer(IID_IUnknown, out); }), {"DENIED"}},
        {"sources list",
         handing([](void** out) { return F3DGetSourcesList(CLSID_3DImageSource, reinterpret_cast<I3DList**>(out)); }),
         failOrNone},
        {"find source",
         handing([&](void** out) { return F3DFindSource(CLSID_3DImageSource, platePath, IID_IUnknown, out); }),
         failOrNone},
        {"find all sources", handing([&](void** out) {
             return F3DFindAllSources(CLSID_3DImageSource, cleanPath, reinterpret_cast<I3DList**>(out)); }),
         {"DENIED", "E_FAIL", "S_FALSE", "S_OK"}},
        {"find clip", handing([&](void** out) { return F3DFindImageClip(plate.Get(), IID_IUnknown, out); }), failOrNone},
        {"top-most operator",
         handing([&](void** out) { return F3DGetTopMostOp(arm.Get(), 0, 0, kBlur, IID_IUnknown, out); }),
         {"NOTFOUND", "S_OK"}},
        {"primary folder",
         handing([&](void** out) { return KXGetPrimaryFolderForAction(arm.Get(), IID_IUnknown, out); }), {"E_FAIL"}},
        {"source names", [&] { return std::pair(F3DMakeSourceList(entries, true), nothing); }, failOrNone},
        {"clip names", [&] { return std::pair(F3DMakeClipList(entries, false), nothing); }, failOrNone},
    };
    // clang-format on
    int walked = 0;
    for (const Walk& walk : walks) {
        ut::test::WalkHostFaults([&] { return ut::test::Released(walk.run()); },
                                 [&](int row, const std::pair<HRESULT, bool>& outcome) {
                                     if (row == 0)
                                         return;
                                     SCOPED_TRACE(std::string(walk.name) + " at call " + std::to_string(row));
                                     ++walked;
                                     EXPECT_TRUE(walk.answers.count(Result(outcome.first)))
                                         << Result(outcome.first);
                                     bool keepsItsList = std::string(walk.name) == "find all sources";
                                     EXPECT_TRUE(SUCCEEDED(outcome.first) || keepsItsList || !outcome.second);
                                 },
                                 E_ACCESSDENIED);
    }
    std::cout << "[ walked   ] " << walked << " failure paths in " << std::size(walks) << " scenarios\n";
}

} // namespace
