// The reference host's folders: the scene's layer, pass, parameter-type and environment
// containers and the content container's reference-plane folder, device manager and cache
// manager. Each holds the names of its members and answers the interface of its role.
#pragma once

#include <string>
#include <vector>

#include <ut/sdk/comobject.h>
#include <ut/sdk/content.h>
#include <ut/sdk/scene.h>

namespace ut::host {

class Folder final : public ut::sdk::ComObject<IKXLayerContainer, I3DRefPlaneFolder, I3DCacheMgr> {
public:
    // What the folder is, beyond an IUnknown.
    enum class Role { kPlain, kLayers, kReferencePlanes, kCaches };

    Folder(Role role, std::vector<std::wstring> members) : role_(role), members_(std::move(members)) {}

    std::span<const InterfaceEntry> GetInterfaceMap() const override;

    const std::vector<std::wstring>& Members() const { return members_; }

private:
    Role role_;
    std::vector<std::wstring> members_;
};

} // namespace ut::host
