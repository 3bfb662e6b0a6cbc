// The reference host: small, real, in-process implementations of the application services that
// the library reaches through the SDK. Tools and integration tests run on it; an application
// that embeds the library installs its own services instead.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include <ut/host/reference_presets.h>
#include <ut/host/reference_scene.h>
#include <ut/platform/com.h>
#include <ut/sdk/scene.h>
#include <ut/sdk/time.h>

namespace ut::host {

// What the reference host answers where a real application would consult itself. The defaults
// describe a recent host: it names itself, and its major version and build are past every
// boundary that older stream formats are told apart by, so nothing is loaded in a legacy mode.
struct Settings {
    // Strings of the version-information object; an empty one is a string the host does not have.
    std::wstring productName = L"ut reference host";
    std::wstring build = L"1200"; // four digits
    std::wstring major = L"2003";
    // The mode the active database reports.
    ULONG activeDatabaseMode = 0;
    // Seeds of the ambient values "referencing.importingdelta" and "context.constructionmode".
    bool importingDelta = false;
    LONG constructionMode = 0;
    // The scene's time: the format and rate the time manager answers (a scene at 30 frames a
    // second) and how it shows times.
    tagGWTIMEFORMAT timeFormat = GWTIMEFORMAT_VIDEO30;
    double frameRate = 30.0;
    GWTIMEDISPLAYFORMAT timeDisplay = GWTIMEDISPLAY_FRAMES;
    // The play control's position and range, in frames of the scene.
    double playFrame = 1.0;
    double firstFrame = 1.0;
    double lastFrame = 100.0;
    // The key time of every content container the host makes, in frames, and whether one of them
    // is current from the start (otherwise the library makes its own when it needs one).
    double keyFrame = 1.0;
    bool currentContainer = true;
    // The current scene, and the folders of every content container the host makes.
    SceneDescription scene = {};
    // The property classes the host can create (empty property sets of the class), as the scene
    // does when a scene property is asked for that it lacks.
    std::vector<CLSID> propertyClasses = {GUID_GWTimeMappingProperty};
    // The parameter dictionary: parameters (by id) that are also known by a second id.
    std::vector<std::pair<GUID, GUID>> parameterAliases = {};
    // The scene viewer's picture, for thumbnails: the BMP file `thumbnailImage`, else a rendered
    // view of the scene when `thumbnailRender` is set; with neither, there is no viewer.
    std::wstring thumbnailImage = {};
    bool thumbnailRender = false;
    // Presets: the sub-folder below "Data\GWPresets" that holds a class's presets, and the presets
    // family commands make by name (each command is installed as a service under its id).
    std::vector<std::pair<CLSID, std::wstring>> presetFolders = {};
    std::vector<PresetDescription> commandPresets = {};
    // Plug-in classes the host can create (objects that say their class and hold parameters).
    std::vector<CLSID> pluginClasses = {};
};

class SceneManager;
class UndoManager;

// Installs the reference services for its lifetime and revokes exactly what it installed.
// One at a time: installing a second one replaces the first one's services.
class ReferenceHost {
public:
    explicit ReferenceHost(const Settings& settings = {});
    ~ReferenceHost();
    ReferenceHost(const ReferenceHost&) = delete;
    ReferenceHost& operator=(const ReferenceHost&) = delete;

    // S_OK when every service was installed.
    HRESULT Status() const { return status_; }

    // The current scene as it stands now, in the form it was set up from.
    SceneDescription DescribeScene() const;
    // The names of the complex-undo steps closed so far, in order.
    std::vector<std::wstring> UndoSteps() const;
    // GW3DNOTIFY_QUIET while the scene holds its notifications back, else GW3DNOTIFY_NORMAL.
    LONG SceneNotificationMode() const;

private:
    HRESULT InstallService(REFCLSID clsid, IUnknown* service);
    HRESULT InstallClass(REFCLSID clsid, IClassFactory* factory);
    HRESULT Record(HRESULT hr);
    // Makes a content container of the installed class current.
    HRESULT OpenContainer();

    HRESULT InstallScene(const Settings& settings);

    std::vector<CLSID> services_;
    std::vector<CLSID> classes_;
    bool containerOpened_ = false;
    HRESULT status_ = S_OK;
    ContainersDescription containerFolders_;
    ut::ComPtr<SceneManager> sceneManager_;
    ut::ComPtr<UndoManager> undoManager_;
};

} // namespace ut::host
