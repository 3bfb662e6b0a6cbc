// A short tour of the library on the reference host.
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/detail/names.h>
#include <ut/host/reference_host.h>
#include <ut/platform/process.h>
#include <ut/platform/storage.h>
#include <ut/platform/stream.h>
#include <ut/platform/text.h>
#include <ut/platform/variant.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/resources.h>
#include <ut/ut.h>

#include "commands.h"

namespace ut::tool {
namespace {

std::string Narrow(const std::wstring& text) {
    return ut::platform::Utf8FromWide(text);
}

int ShowModule() {
    HINSTANCE library = KXDictFindInstance(ut::kDictionaryName);
    if (!library) {
        std::printf("module      the library did not register its dictionary: it failed to load\n");
        return 1;
    }
    wchar_t key[ut::kPathCapacity];
    if (GWResourceConstructRegKey(library, L"", key, ut::kPathCapacity) != ERROR_SUCCESS) {
        std::printf("module      no registry base key\n");
        return 1;
    }
    std::printf("module      %s\n", Narrow(ut::platform::ModuleFileName(library)).c_str());
    std::printf("base key    HKEY_LOCAL_MACHINE\\%s\n", Narrow(key).c_str());
    return 0;
}

int ShowGuidRoundTrip() {
    constexpr GUID compressor = {
        0x1C36C8C0, 0xA6A4, 0x11D3, {0xB4, 0xB3, 0x00, 0xA0, 0x24, 0x4E, 0xEB, 0x76}};
    std::wstring text = ut::GuidToString(compressor);
    GUID back{};
    bool same = SUCCEEDED(ut::ParseGuid(text.c_str(), &back)) && IsEqualGUID(back, compressor);
    std::printf("guid        %s -> %s\n", Narrow(text).c_str(), same ? "same GUID back" : "MISMATCH");
    return same ? 0 : 1;
}

int ShowStreamRoundTrip() {
    ut::ComPtr<IStream> stream;
    const char payload[] = "scene data";
    if (FAILED(ut::platform::CreateMemoryStream(stream.Put())) ||
        FAILED(stream->Write(payload, sizeof payload - 1, nullptr)))
        return 1;
    LARGE_INTEGER start{};
    stream->Seek(start, STREAM_SEEK_SET, nullptr);
    char back[sizeof payload] = {};
    ULONG read = 0;
    stream->Read(back, sizeof payload - 1, &read);
    std::printf("stream      wrote %u bytes, read back \"%s\"\n", static_cast<unsigned>(read), back);
    return std::string(back) == payload ? 0 : 1;
}

std::string FourCharacters(ULONG code) {
    std::string text;
    for (int shift = 24; shift >= 0; shift -= 8)
        text += static_cast<char>((code >> shift) & 0xFF);
    return text;
}

int ShowVersions() {
    ULONG loaded = 0, current = 0;
    KXGetFeatureVersion(eFeaturesVersionScene, &loaded, &current);
    tagVersion persisted = F3DGetVersionPersisted(S_OK, 0);
    std::printf("versions    scene feature: current %u, loaded %u; this host persists format %s\n",
                static_cast<unsigned>(current), static_cast<unsigned>(loaded),
                FourCharacters(persisted).c_str());
    return 0;
}

// Tells every listener that the application changed state, as the application would.
void BroadcastStateChange(USHORT state) {
    ut::ComPtr<IGWNotificationService> service;
    if (FAILED(
            GWQueryGenericObject(CLSID_GWNotificationService, IID_IGWNotificationService, service.PutVoid())))
        return;
    ut::Variant value;
    value->vt = VT_I4;
    value->lVal = state;
    service->Broadcast(ut::sdk::kAppStateChange, ut::sdk::kStateChangeKind, value.Get());
}

int ShowMemoryPool() {
    CMemoryPool pool;
    void* first = pool.Allocate(20);
    pool.Deallocate(first);
    void* second = pool.Allocate(30);
    bool reused = first == second;
    pool.Deallocate(second);
    pool.Diagnostics();
    std::size_t keptBefore = pool.TotalFreeCount;
    BroadcastStateChange(3);
    pool.Diagnostics();
    std::printf("pool        20 then 30 bytes: %s; kept blocks %zu, after a state change %zu\n",
                reused ? "same block reused" : "NOT reused", keptBefore, pool.TotalFreeCount);
    return reused && keptBefore == 1 && pool.TotalFreeCount == 0 ? 0 : 1;
}

// A small scene: objects with a name, an id, a transform and a chunk of parameters.
constexpr int kSceneObjects = 200;

void WriteScene(C3DStreamHelper& out) {
    for (int i = 0; i < kSceneObjects; ++i) {
        out.ChunkWriteOpen("OBJ ", 3);
        out.PutString(CKXString(L"object") + std::to_wstring(i).c_str());
        out.PutUInt32(static_cast<ULONG>(1000 + i));
        for (int k = 0; k < 12; ++k)
            out.PutDouble(k % 5 == 0 ? 1.0 : (k == 11 ? i * 0.5 : 0.0));
        out.ChunkWriteOpen("PARM", 1);
        out.PutInt32(-i);
        out.PutDouble(0.1 * i);
        out.ChunkWriteClose();
        out.ChunkWriteClose();
    }
}

// Reads the scene back and answers how many objects it found with the ids they were given.
int ReadScene(C3DStreamHelper& in) {
    int found = 0;
    for (int i = 0; i < kSceneObjects; ++i) {
        ULONG version = 0, id = 0;
        CKXString name;
        if (in.ChunkReadOpen("OBJ ", &version) != S_OK || FAILED(in.GetString(name)) ||
            FAILED(in.GetUInt32(id)))
            break;
        found += id == static_cast<ULONG>(1000 + i) ? 1 : 0;
        in.ChunkReadClose(); // skips the transform and the parameters
    }
    return found;
}

ULONGLONG StreamSize(IStream* stream) {
    STATSTG stat{};
    return SUCCEEDED(stream->Stat(&stat, STATFLAG_NONAME)) ? stat.cbSize.QuadPart : 0;
}

// Writes the bytes of `stream` as the stream "Scene" of a new compound file at `path`.
int SaveSceneFile(IStream* stream, const std::string& path) {
    std::vector<char> bytes(static_cast<std::size_t>(StreamSize(stream)));
    LARGE_INTEGER start{};
    ULONG read = 0;
    ut::ComPtr<IStorage> root;
    ut::ComPtr<IStream> scene;
    std::wstring name = ut::platform::WideFromUtf8(path);
    HRESULT hr = stream->Seek(start, STREAM_SEEK_SET, nullptr);
    if (SUCCEEDED(hr))
        hr = stream->Read(bytes.data(), static_cast<ULONG>(bytes.size()), &read);
    if (SUCCEEDED(hr))
        hr = StgCreateDocfile(name.c_str(), STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE, 0,
                              root.Put());
    if (SUCCEEDED(hr))
        hr = root->CreateStream(L"Scene", STGM_CREATE | STGM_READWRITE | STGM_SHARE_EXCLUSIVE, 0, 0,
                                scene.Put());
    if (SUCCEEDED(hr))
        hr = scene->Write(bytes.data(), read, nullptr);
    scene.Reset();
    if (SUCCEEDED(hr))
        hr = root->Commit(STGC_DEFAULT);
    std::printf("save        the compact stream as \"Scene\" in %s: %s\n", path.c_str(),
                SUCCEEDED(hr) ? "written" : "NOT written");
    return SUCCEEDED(hr) ? 0 : 1;
}

int ShowPersistence(const std::string& savePath) {
    ut::ComPtr<IStream> plain, compact, saving;
    if (FAILED(ut::platform::CreateMemoryStream(plain.Put())) ||
        FAILED(ut::platform::CreateMemoryStream(compact.Put())))
        return 1;
    {
        C3DStreamHelper out(plain.Get()); // a bare stream: the plain form older savers wrote
        WriteScene(out);
    }
    if (FAILED(KXOpenPersistStreamForSave(compact.Get(), nullptr, saving.Put())))
        return 1;
    {
        C3DStreamHelper out(saving.Get());
        WriteScene(out);
    }
    KXClosePersistStream(saving.Get());
    saving.Reset();

    LARGE_INTEGER start{};
    compact->Seek(start, STREAM_SEEK_SET, nullptr);
    ut::ComPtr<IStream> loading;
    if (FAILED(KXOpenPersistStreamForLoad(compact.Get(), nullptr, loading.Put())))
        return 1;
    C3DStreamHelper in(loading.Get());
    int found = ReadScene(in);
    ULONGLONG plainBytes = StreamSize(plain.Get()), compactBytes = StreamSize(compact.Get());
    std::printf("persist     %d objects: plain %llu bytes, compact %llu bytes (%.0f%%); read back %d\n",
                kSceneObjects, static_cast<unsigned long long>(plainBytes),
                static_cast<unsigned long long>(compactBytes),
                plainBytes ? 100.0 * static_cast<double>(compactBytes) / static_cast<double>(plainBytes)
                           : 0.0,
                found);
    int saved = savePath.empty() ? 0 : SaveSceneFile(compact.Get(), savePath);
    return found == kSceneObjects ? saved : 1;
}

// Counts the objects at and below `object`.
int CountObjects(I3DObject* object) {
    int count = 1;
    ut::ComPtr<I3DList> children;
    ULONG size = 0;
    if (object->GetChildren(children.Put()) != S_OK || FAILED(children->GetCount(&size)))
        return count;
    for (ULONG i = 0; i < size; ++i) {
        ut::ComPtr<I3DElemRef> element;
        ut::ComPtr<I3DObject> child;
        if (SUCCEEDED(children->GetItem(i, element.Put())) &&
            element->GetTarget(IID_I3DObject, child.PutVoid(), 1) == S_OK)
            count += CountObjects(child.Get());
    }
    return count;
}

// Builds a robot of three parts in one undo step, as a plug-in would, then finds a part by name
// and walks the scene from its root model.
int ShowScene(const ut::host::ReferenceHost& host) {
    {
        C3DComplexUndo step(L"Build the robot");
        ut::ComPtr<I3DObject> robot;
        if (FAILED(KXCreate3DModelObject(L"Robot", IID_I3DObject, robot.PutVoid())) ||
            FAILED(F3DAdd3DObjectToScene(robot.Get(), nullptr, 0)))
            return 1;
        for (const wchar_t* name : {L"Arm", L"Leg", L"Head"}) {
            ut::ComPtr<I3DObject> part;
            if (FAILED(KXCreate3DModelObject(name, IID_I3DObject, part.PutVoid())) ||
                FAILED(F3DAdd3DObjectToScene(part.Get(), robot.Get(), name[0] == L'A')))
                return 1;
        }
    }
    wchar_t arm[] = L"Arm";
    ut::ComPtr<I3DObject> found, root;
    bool selected = F3DGet3DObjectFromName(arm, found.Put()) == S_OK && KXIsActiveDataSelected(found.Get());
    if (FAILED(KXGetCurrentSceneModel(IID_I3DObject, root.PutVoid())))
        return 1;
    std::vector<std::wstring> steps = host.UndoSteps();
    std::printf("scene       built a robot of 3 parts in the undo step \"%s\"; Arm found by name%s; "
                "%d objects from the root\n",
                steps.empty() ? "" : Narrow(steps.back()).c_str(), selected ? " and selected" : "",
                CountObjects(root.Get()));
    return selected && steps.size() == 1 ? 0 : 1;
}

// The names a category holds, in the registry's order, joined with ", ".
std::string NamesIn(const wchar_t* category) {
    DWORD count = 0;
    GUID* list = nullptr;
    if (FAILED(KXGetCLSIDList(category, &count, &list)))
        return "(none)";
    std::unique_ptr<GUID, ut::TaskMemDeleter> owned(list);
    std::string names;
    for (DWORD i = 0; i < count; ++i) {
        wchar_t name[80] = L"";
        DWORD bytes = sizeof name;
        (void)KXGetKeyName(category, list[i], name, &bytes); // an unnamed class shows as empty
        names += (i ? ", " : "") + Narrow(name);
    }
    return names;
}

// A sample plug-in registers two operators (named from its string table) and a view, lists them
// back, and removes them again.
int ShowRegistration() {
    HINSTANCE plugin = ut::platform::ModuleOf(reinterpret_cast<const void*>(&ShowRegistration));
    const KXDictString strings[] = {{1, L"Sample twist"}, {2, L"Sample bend"}};
    constexpr GUID twist = {0x5A3F1E01, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    constexpr GUID bend = {0x5A3F1E02, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    constexpr GUID view = {0x5A3F1E03, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    bool registered = KXDictAddInstanceStrings(plugin, strings, 2) == S_OK &&
                      KXRegisterOperator(twist, plugin, 1u) == S_OK &&
                      KXRegisterOperator(bend, plugin, 2u) == S_OK &&
                      KXRegisterView(view, plugin, L"Sample curve view") == S_OK;
    std::printf("registry    Operator: %s; View: %s\n", NamesIn(L"Operator").c_str(),
                NamesIn(L"View").c_str());
    bool removed = SUCCEEDED(KXUnRegisterOperator(twist)) && SUCCEEDED(KXUnRegisterOperator(bend)) &&
                   SUCCEEDED(KXUnRegisterView(view));
    return registered && removed ? 0 : 1;
}

void RunDemo(const std::string& savePath) {
    ut::host::ReferenceHost host;
    if (FAILED(host.Status()))
        Fail(kExitNo, "the reference host did not start");
    int failures = ShowModule() + ShowGuidRoundTrip() + ShowStreamRoundTrip() + ShowPersistence(savePath) +
                   ShowVersions() + ShowMemoryPool() + ShowRegistration() + ShowScene(host);
    if (failures)
        Fail(kExitNo, "the tour found " + std::to_string(failures) + " part(s) not working");
}

} // namespace

void AddDemoCommand(CLI::App& app) {
    CLI::App* demo = app.add_subcommand(
        "demo", "Load the library on the reference host and show what it does (module, GUIDs, streams, "
                "persistence, versions, memory pool, registration, a scene).");
    auto savePath = std::make_shared<std::string>();
    demo->add_option("--save", *savePath, "also write the persisted scene as a compound file");
    demo->footer("Example:\n  ut demo --save scene.scn");
    demo->callback([savePath] { RunDemo(*savePath); });
}

} // namespace ut::tool
