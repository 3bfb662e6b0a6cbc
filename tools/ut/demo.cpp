// The tour a new user takes: the library loaded on the reference host, a plug-in registering its
// classes, a scene built, saved compact into a compound scene file and read back, its stream's
// chunks, frame patterns, sources and the memory pool, each step timed.
#include <chrono>
#include <cstdarg>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include <ut/detail/names.h>
#include <ut/host/reference_host.h>
#include <ut/host/reference_presets.h>
#include <ut/platform/files.h>
#include <ut/platform/process.h>
#include <ut/platform/storage.h>
#include <ut/platform/stream.h>
#include <ut/platform/text.h>
#include <ut/platform/variant.h>
#include <ut/sdk/notify.h>
#include <ut/sdk/objects.h>
#include <ut/sdk/preferences.h>
#include <ut/sdk/resources.h>
#include <ut/sdk/thumbnails.h>
#include <ut/ut.h>

#include "commands.h"
#include "stream_decoder.h"

namespace ut::tool {
namespace {

std::string Narrow(std::wstring_view text) {
    return ut::platform::Utf8FromWide(text);
}

// What a step did, in one line of printf-formatted text.
class Said {
public:
    [[gnu::format(gnu_printf, 2, 3)]] void operator()(const char* format, ...) {
        va_list arguments;
        va_start(arguments, format);
        char line[512];
        std::vsnprintf(line, sizeof line, format, arguments);
        va_end(arguments);
        text_ += text_.empty() ? line : std::string("; ") + line;
    }
    const std::string& Text() const { return text_; }

private:
    std::string text_;
};

// Runs the steps in order, printing each one's name, time and what it did.
class Tour {
public:
    template <class Step>
    void Run(const char* name, Step step) {
        Said said;
        auto start = std::chrono::steady_clock::now();
        bool worked = step(said);
        std::chrono::duration<double, std::milli> took = std::chrono::steady_clock::now() - start;
        std::printf("%-10s %8.2f ms  %s%s\n", name, took.count(), said.Text().c_str(),
                    worked ? "" : "  [NOT WORKING]");
        std::fflush(stdout);
        failures_ += worked ? 0 : 1;
    }
    int Failures() const { return failures_; }

private:
    int failures_ = 0;
};

bool ShowModule(Said& say) {
    HINSTANCE library = KXDictFindInstance(ut::kDictionaryName);
    wchar_t key[ut::kPathCapacity];
    if (!library || GWResourceConstructRegKey(library, L"", key, ut::kPathCapacity) != ERROR_SUCCESS) {
        say("the library did not register its dictionary or has no registry base key");
        return false;
    }
    ULONG loaded = 0, current = 0;
    KXGetFeatureVersion(eFeaturesVersionScene, &loaded, &current);
    say("%s, registry base key HKEY_LOCAL_MACHINE\\%s, scene feature version %u",
        Narrow(ut::platform::ModuleFileName(library)).c_str(), Narrow(key).c_str(),
        static_cast<unsigned>(current));
    return true;
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
bool ShowRegistration(Said& say) {
    HINSTANCE plugin = ut::platform::ModuleOf(reinterpret_cast<const void*>(&ShowRegistration));
    const KXDictString strings[] = {{1, L"Sample twist"}, {2, L"Sample bend"}};
    constexpr GUID twist = {0x5A3F1E01, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    constexpr GUID bend = {0x5A3F1E02, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    constexpr GUID view = {0x5A3F1E03, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
    bool registered = KXDictAddInstanceStrings(plugin, strings, 2) == S_OK &&
                      KXRegisterOperator(twist, plugin, 1u) == S_OK &&
                      KXRegisterOperator(bend, plugin, 2u) == S_OK &&
                      KXRegisterView(view, plugin, L"Sample curve view") == S_OK;
    say("a plug-in registered Operator: %s; View: %s; and removed them", NamesIn(L"Operator").c_str(),
        NamesIn(L"View").c_str());
    bool removed = SUCCEEDED(KXUnRegisterOperator(twist)) && SUCCEEDED(KXUnRegisterOperator(bend)) &&
                   SUCCEEDED(KXUnRegisterView(view));
    return registered && removed;
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
bool ShowScene(const ut::host::ReferenceHost& host, Said& say) {
    {
        C3DComplexUndo step(L"Build the robot");
        ut::ComPtr<I3DObject> robot;
        if (FAILED(KXCreate3DModelObject(L"Robot", IID_I3DObject, robot.PutVoid())) ||
            FAILED(F3DAdd3DObjectToScene(robot.Get(), nullptr, 0)))
            return false;
        for (const wchar_t* name : {L"Arm", L"Leg", L"Head"}) {
            ut::ComPtr<I3DObject> part;
            if (FAILED(KXCreate3DModelObject(name, IID_I3DObject, part.PutVoid())) ||
                FAILED(F3DAdd3DObjectToScene(part.Get(), robot.Get(), name[0] == L'A')))
                return false;
        }
    }
    wchar_t arm[] = L"Arm";
    ut::ComPtr<I3DObject> found, root;
    bool selected = F3DGet3DObjectFromName(arm, found.Put()) == S_OK && KXIsActiveDataSelected(found.Get());
    if (FAILED(KXGetCurrentSceneModel(IID_I3DObject, root.PutVoid())))
        return false;
    std::vector<std::wstring> steps = host.UndoSteps();
    say("built a robot of 3 parts in the undo step \"%s\"; Arm found by name%s; %d objects from the root",
        steps.empty() ? "" : Narrow(steps.back()).c_str(), selected ? " and selected" : "",
        CountObjects(root.Get()));
    return selected && steps.size() == 1;
}

// The scene that is saved: objects with a name, an id, a transform and a chunk of parameters.
constexpr int kSceneObjects = 200;
constexpr wchar_t kSceneStream[] = L"Scene";

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

std::vector<std::uint8_t> StreamBytes(IStream* stream) {
    std::vector<std::uint8_t> bytes(static_cast<std::size_t>(StreamSize(stream)));
    LARGE_INTEGER start{};
    ULONG read = 0;
    if (FAILED(stream->Seek(start, STREAM_SEEK_SET, nullptr)) ||
        FAILED(stream->Read(bytes.data(), static_cast<ULONG>(bytes.size()), &read)))
        read = 0;
    bytes.resize(read);
    return bytes;
}

constexpr DWORD kExclusive = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;

// The scene saved in both forms: compact into the stream "Scene" of a new compound file at
// `path`, plain into memory only to compare sizes.
bool ShowSave(const std::wstring& path, Said& say) {
    ut::ComPtr<IStream> plain, saving;
    ut::ComPtr<IStorage> root;
    ut::ComPtr<IStream> scene;
    if (FAILED(ut::platform::CreateMemoryStream(plain.Put())) ||
        FAILED(StgCreateDocfile(path.c_str(), STGM_CREATE | kExclusive, 0, root.Put())) ||
        FAILED(root->CreateStream(kSceneStream, STGM_CREATE | kExclusive, 0, 0, scene.Put())) ||
        FAILED(KXOpenPersistStreamForSave(scene.Get(), nullptr, saving.Put())))
        return false;
    {
        C3DStreamHelper out(plain.Get()); // a bare stream: the plain form older savers wrote
        WriteScene(out);
    }
    {
        C3DStreamHelper out(saving.Get());
        WriteScene(out);
    }
    KXClosePersistStream(saving.Get());
    saving.Reset();
    ULONGLONG plainBytes = StreamSize(plain.Get()), compactBytes = StreamSize(scene.Get());
    scene.Reset();
    bool committed = SUCCEEDED(root->Commit(STGC_DEFAULT));
    say("%d objects compact in %llu bytes (%.0f%% of the plain form's %llu) as \"Scene\" in %s",
        kSceneObjects, static_cast<unsigned long long>(compactBytes),
        plainBytes ? 100.0 * static_cast<double>(compactBytes) / static_cast<double>(plainBytes) : 0.0,
        static_cast<unsigned long long>(plainBytes), Narrow(path).c_str());
    return committed;
}

// The scene file opened again and its objects read back.
bool ShowReload(const std::wstring& path, std::vector<std::uint8_t>& bytes, Said& say) {
    ut::ComPtr<IStorage> root;
    ut::ComPtr<IStream> scene, loading;
    if (FAILED(StgOpenStorage(path.c_str(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, nullptr, 0,
                              root.Put())) ||
        FAILED(root->OpenStream(kSceneStream, nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, 0, scene.Put())))
        return false;
    bytes = StreamBytes(scene.Get());
    LARGE_INTEGER start{};
    if (FAILED(scene->Seek(start, STREAM_SEEK_SET, nullptr)) ||
        FAILED(KXOpenPersistStreamForLoad(scene.Get(), nullptr, loading.Put())))
        return false;
    C3DStreamHelper in(loading.Get());
    int found = ReadScene(in);
    say("%d of %d objects read back from the file's \"Scene\" stream", found, kSceneObjects);
    return found == kSceneObjects;
}

// The scene view's picture written into the scene file as its thumbnail, and read back.
bool ShowThumbnail(const std::wstring& path, Said& say) {
    int available = 0;
    if (FAILED(KXIsThumbnailAvaiable(&available)) || !available ||
        KXPutThumnailInFile(CKXString(path.c_str())) != S_OK)
        return false;
    ut::ComPtr<IStorage> root;
    ut::ComPtr<IGWImage> image;
    ULONG width = 0, height = 0;
    if (FAILED(StgOpenStorage(path.c_str(), nullptr, STGM_READ | STGM_SHARE_EXCLUSIVE, nullptr, 0,
                              root.Put())) ||
        GWGetThumbnail(root.Get(), image.Put()) != S_OK || FAILED(image->GetSize(&width, &height)))
        return false;
    say("a %lux%lu picture of the rendered view in the file's summary information",
        static_cast<unsigned long>(width), static_cast<unsigned long>(height));
    return width == 64 && height == 64;
}

int CountChunks(const std::vector<DecodedChunk>& chunks) {
    int count = 0;
    for (const DecodedChunk& chunk : chunks)
        count += 1 + CountChunks(chunk.children);
    return count;
}

// The chunk tree of the stream read back, as `ut stream dump` shows it.
bool ShowDump(std::span<const std::uint8_t> bytes, Said& say) {
    DecodedStream decoded;
    std::string error;
    if (!DecodeStream(bytes, {}, decoded, error)) {
        say("%s", error.c_str());
        return false;
    }
    std::string rows;
    for (const HeaderRow& row : decoded.table)
        rows += (rows.empty() ? "" : ", ") + ChunkIdText(row.id) + " v" + VersionText(row.version);
    say("%zu bytes, %s form: %zu chunks at the top, %d in all; header table: %s", decoded.size,
        decoded.compact ? "compact" : "plain", decoded.chunks.size(), CountChunks(decoded.chunks),
        rows.c_str());
    return decoded.compact && CountChunks(decoded.chunks) > kSceneObjects;
}

// A light class with its presets in the "Lights" sub-folder, as a lighting plug-in would have.
constexpr GUID kSpotLight = {0x5A3F1E10, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};
constexpr GUID kIntensity = {0x5A3F1E11, 0xD3C2, 0x4B7A, {0x9E, 0x10, 0x6C, 0x21, 0x8D, 0x44, 0x0A, 0x01}};

// The user's folder of the tour: a temporary folder named in the preferences while it lives; the
// user's own setting is put back afterwards.
class TourUserFolder {
public:
    TourUserFolder() {
        std::error_code error;
        folder_ = std::filesystem::temp_directory_path(error) /
                  ("ut-tour-" + std::to_string(std::chrono::steady_clock::now().time_since_epoch().count()));
        if (error || !std::filesystem::create_directories(folder_, error) ||
            FAILED(KXGetPreferencesMgr(preferences_.Put())))
            return;
        wchar_t* previous = nullptr;
        (void)preferences_->GetText(kSetting, &previous); // none is an empty setting
        previous_ = previous ? previous : L"";
        CoTaskMemFree(previous);
        set_ = SUCCEEDED(preferences_->SetText(kSetting, folder_.wstring().c_str()));
    }
    ~TourUserFolder() {
        if (set_)
            (void)preferences_->SetText(kSetting, previous_.c_str()); // best effort on the way out
        std::error_code ignored;
        std::filesystem::remove_all(folder_, ignored);
    }
    TourUserFolder(const TourUserFolder&) = delete;
    TourUserFolder& operator=(const TourUserFolder&) = delete;
    bool Ready() const { return set_; }
    const std::filesystem::path& Path() const { return folder_; }

private:
    static constexpr wchar_t kSetting[] = L"paths.user";
    std::filesystem::path folder_;
    ut::ComPtr<IGWPreferences> preferences_;
    std::wstring previous_;
    bool set_ = false;
};

HRESULT WriteSpotPreset(const std::filesystem::path& presets, double intensity) {
    std::error_code error;
    std::filesystem::create_directories(presets / "Lights", error);
    ut::host::PresetDescription preset;
    preset.objectClass = kSpotLight;
    preset.values = {{kIntensity, L"intensity", intensity}};
    return error ? E_FAIL : ut::host::WritePresetFile((presets / "Lights" / "Spot.Preset").wstring(), preset);
}

// The preset "Spot" in the user's folder and in an add-on of the user's: found in the add-on (a
// later kind of location wins), an object made from it, and its class found again in the cache.
bool ShowPresets(Said& say) {
    TourUserFolder user;
    const std::filesystem::path presets = std::filesystem::path("Data") / "GWPresets";
    if (!user.Ready() || FAILED(WriteSpotPreset(user.Path() / presets, 1.0)) ||
        FAILED(WriteSpotPreset(user.Path() / "Addons" / "Studio" / presets, 2.5)))
        return false;
    CKXString found;
    ut::ComPtr<IUnknown> light;
    ut::ComPtr<IGWPreset> preset;
    wchar_t* file = nullptr;
    GUID made = GUID_NULL;
    if (FAILED(KXFindPresetPath(kSpotLight, L"Spot.Preset", found)) ||
        FAILED(KXCreateObjectFromPreset(kSpotLight, L"Spot", GUID_NULL, light.PutVoid(), preset.Put(),
                                        nullptr)) ||
        FAILED(KXGetFilePathFromPreset(preset.Get(), &file)) ||
        FAILED(KXGetObjectCLSIDFromPreset(kSpotLight, L"Spot", &made)))
        return false;
    std::unique_ptr<wchar_t[]> created(file);
    std::wstring where(found.View());
    where.replace(0, std::min(where.size(), user.Path().wstring().size()), L"<user>");
    say("Spot in the user's folder and the user's add-on Studio: the add-on's wins (%s); a light "
        "made from it; its class %s again from the cache",
        Narrow(where).c_str(), Narrow(ut::GuidToString(made)).c_str());
    return IsEqualGUID(made, kSpotLight) && std::wstring(created.get()) == found.View();
}

bool ShowFrames(Said& say) {
    wchar_t one[ut::kPathCapacity], range[ut::kPathCapacity], bare[ut::kPathCapacity];
    KXExpandFramePadding(L"shot.####.pic", 42, one);
    KXExpandFramePadding_Range(L"shot.####.pic", 1, 240, range);
    KXRemoveFramePadding(L"shot.####.pic", bare);
    say("shot.####.pic: frame 42 %s, frames 1 to 240 %s, no frame %s", Narrow(one).c_str(),
        Narrow(range).c_str(), Narrow(bare).c_str());
    return std::wstring(one) == L"shot.0042.pic";
}

bool ShowSources(Said& say) {
    std::vector<std::pair<unsigned int, CKXString>> sources, clips;
    (void)F3DMakeSourceList(sources, true); // none found shows as an empty list
    (void)F3DMakeClipList(clips, true);
    std::string names;
    for (const auto& [index, name] : sources)
        names += (names.empty() ? "" : ", ") + Narrow(name.View());
    say("%zu source(s) (%s) and %zu clip(s) in the sample scene", sources.size(), names.c_str(),
        clips.size());
    return !sources.empty();
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

bool ShowMemoryPool(Said& say) {
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
    say("20 then 30 bytes: %s; kept blocks %zu, after a state change %zu",
        reused ? "same block reused" : "NOT reused", keptBefore, pool.TotalFreeCount);
    return reused && keptBefore == 1 && pool.TotalFreeCount == 0;
}

// The scene file: `savePath`, or a temporary file that goes at the end of the tour.
class SceneFile {
public:
    explicit SceneFile(const std::string& savePath) {
        if (!savePath.empty()) {
            path_ = ut::platform::WideFromUtf8(savePath);
            return;
        }
        wchar_t folder[ut::kPathCapacity], name[ut::kPathCapacity];
        if (GetTempPathW(ut::kPathCapacity, folder) && GetTempFileNameW(folder, L"K3D", 0, name)) {
            path_ = name;
            temporary_ = true;
        }
    }
    ~SceneFile() {
        if (temporary_)
            (void)DeleteFileW(path_.c_str()); // a leftover temporary file is harmless
    }
    SceneFile(const SceneFile&) = delete;
    SceneFile& operator=(const SceneFile&) = delete;
    const std::wstring& Path() const { return path_; }

private:
    std::wstring path_;
    bool temporary_ = false;
};

void RunDemo(const std::string& savePath) {
    ut::host::Settings settings;
    settings.scene = SampleScene();
    settings.thumbnailRender = true;
    settings.pluginClasses = {kSpotLight};
    settings.presetFolders = {{kSpotLight, L"Lights"}};
    ut::host::ReferenceHost host(settings);
    if (FAILED(host.Status()))
        Fail(kExitNo, "the reference host did not start");
    SceneFile file(savePath);
    std::vector<std::uint8_t> saved;
    Tour tour;
    tour.Run("load", ShowModule);
    tour.Run("register", ShowRegistration);
    tour.Run("scene", [&](Said& say) { return ShowScene(host, say); });
    tour.Run("save", [&](Said& say) { return ShowSave(file.Path(), say); });
    tour.Run("thumbnail", [&](Said& say) { return ShowThumbnail(file.Path(), say); });
    tour.Run("reload", [&](Said& say) { return ShowReload(file.Path(), saved, say); });
    tour.Run("dump", [&](Said& say) { return ShowDump(saved, say); });
    tour.Run("presets", ShowPresets);
    tour.Run("frames", ShowFrames);
    tour.Run("sources", ShowSources);
    tour.Run("pool", ShowMemoryPool);
    if (tour.Failures())
        Fail(kExitNo, "the tour found " + std::to_string(tour.Failures()) + " step(s) not working");
}

} // namespace

void AddDemoCommand(CLI::App& app) {
    CLI::App* demo = app.add_subcommand(
        "demo", "Tour the library on the reference host: load, register a plug-in's classes, build a scene, "
                "save it compact into a compound scene file with its thumbnail, read it back, dump its "
                "chunks, find a preset and make an object from it, expand frame patterns, list sources, use "
                "the memory pool; each step timed.");
    auto savePath = std::make_shared<std::string>();
    demo->add_option("--save", *savePath, "keep the scene file at this path (else a temporary file)");
    demo->footer("Example:\n  ut demo --save scene.scn");
    demo->callback([savePath] { RunDemo(*savePath); });
}

} // namespace ut::tool
