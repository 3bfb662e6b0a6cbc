// Persistence: the feature-version table and persisted-version codes, and user data blocks.
#pragma once

#include <map>

#include <ut/export.h>
#include <ut/platform/com.h>
#include <ut/platform/stream.h>
#include <ut/sdk/comobject.h>
#include <ut/sdk/string.h>

// ---------------------------------------------------------------------------------------------
// Feature and persisted versions

// The features whose format revision a stream records.
enum tagEFeaturesVersion : ULONG { eFeaturesVersionScene = 0, eFeaturesVersionCount };

// Columns of a row of g_uiFeaturesVersion.
enum : ULONG { eFeatureNumber = 0, eFeatureCurrent = 1, eFeatureLoaded = 2 };

// One row per feature: its number, the version this library writes, the version found in the
// stream being loaded.
UT_API extern ULONG g_uiFeaturesVersion[eFeaturesVersionCount][3];

class C3DStreamHelper;

// Fills the loaded column of g_uiFeaturesVersion from the stream's feature-version chunk. A stream
// without one reports loaded version 0 for the scene feature. S_OK whatever the stream holds.
UT_API HRESULT KXLoadFeaturesVersion(C3DStreamHelper& stream);

// The loaded and current versions of a feature; either pointer may be null. A feature outside
// the table reports nothing.
UT_API void KXGetFeatureVersion(tagEFeaturesVersion feature, ULONG* loaded, ULONG* current);

// The format revision a scene was written with, told from the host that wrote it. Each value is
// its four digits in ASCII, most significant first.
enum tagVersion : ULONG {
    ePersistedVersion1000 = 0x31303030, // the scene's own version chunk is missing
    ePersistedVersion1500 = 0x31353030, // major version 2000, builds up to 0901
    ePersistedVersion1510 = 0x31353130, // major version 2000, builds 0902 to 1023
    ePersistedVersion1511 = 0x31353131, // major version 2000, builds after 1109 or unknown build
    ePersistedVersion1520 = 0x31353230, // major version 2000, builds 1024 to 1109
    ePersistedVersion1531 = 0x31353331, // any other major version
};

// Classifies the running host's build. `openResult` is what opening the caller's version chunk
// answered; STG_E_INVALIDHEADER (the chunk was not there) gives ePersistedVersion1000. The second
// argument is not used.
UT_API tagVersion F3DGetVersionPersisted(HRESULT openResult, ULONG unused);

// Maps the ambient construction mode 0, 1, 2, 3 to the version id 3, 4, 5, 6. Another mode
// leaves `versionId` as it was (S_OK); a failure to read the mode is returned.
UT_API HRESULT F3DGetVersionIdFromMode(ULONG& versionId);

// 1 when the host's active database is in `mode`, 0 otherwise or when it cannot be asked.
UT_API int IsCurrentActiveDBMode(ULONG mode);

// ---------------------------------------------------------------------------------------------
// User data blocks

// The kinds of optional user data a scene object may carry, at most one block of each.
enum eUserDataBlockType : LONG {
    eUserDataBlockType0 = 0,
    eUserDataBlockType1 = 1,
    // The base block's own type, which no class implements.
    eUserDataBlockTypeBase = 2,
};

// {4AF0E60F-DC45-4C99-98FE-03E9468DBAFC}
inline constexpr CLSID CLSID_UserDataBlockType0 = {
    0x4AF0E60F, 0xDC45, 0x4C99, {0x98, 0xFE, 0x03, 0xE9, 0x46, 0x8D, 0xBA, 0xFC}};
// {DC0F9FF8-9C5E-4048-8766-2C4017EF6A18}
inline constexpr CLSID CLSID_UserDataBlockType1 = {
    0xDC0F9FF8, 0x9C5E, 0x4048, {0x87, 0x66, 0x2C, 0x40, 0x17, 0xEF, 0x6A, 0x18}};
// {AD51D1E3-C45C-4B22-B862-F93882B4205F}: answered with the CUserDataBlock itself.
inline constexpr IID IID_CUserDataBlock = {
    0xAD51D1E3, 0xC45C, 0x4B22, {0xB8, 0x62, 0xF9, 0x38, 0x82, 0xB4, 0x20, 0x5F}};

// The base of a block of user data. Concrete blocks live outside the library, registered under
// the class id of their type; this base persists nothing (E_NOTIMPL).
class UT_API CUserDataBlock : public CGWCOMObject {
public:
    CUserDataBlock() = default;

    HRESULT STDMETHODCALLTYPE QueryInterface(REFIID iid, void** object) override;
    ~CUserDataBlock() override;
    void OnFinalRelease() override;

    virtual bool IsPersistable() const;
    virtual HRESULT Load(IStream* stream);
    // Runs once every object of the scene has been loaded.
    virtual HRESULT OnEndLoad();
    virtual HRESULT Save(IStream* stream);
    virtual HRESULT GetAsTextVersion(std::map<CKXString, CKXString>& text);
    virtual HRESULT SetFromTextVersion(std::map<CKXString, CKXString>& text);
    // The base answers eUserDataBlockTypeBase.
    virtual HRESULT GetType(eUserDataBlockType& type);

    // The class that implements blocks of `type`; E_UNEXPECTED, `clsid` untouched, when none does.
    static HRESULT GetCLSIDFromType(const eUserDataBlockType& type, CLSID& clsid);

private:
    CUserDataBlock(const CUserDataBlock&) = delete;
    CUserDataBlock& operator=(const CUserDataBlock&) = delete;
};

UT_INTERFACE_ID(CUserDataBlock, IID_CUserDataBlock);

// The user data blocks of one owner, created on first request and released with the collection.
class UT_API CUserDataBlocks {
public:
    CUserDataBlocks() = default;
    virtual ~CUserDataBlocks();

    // The block of `type`, borrowed (no AddRef): S_OK when it was there already. When it was not,
    // S_FALSE, and with `create` the new block is handed out too, so the pointer tells the two
    // apart. E_UNEXPECTED for a type without a class; a failed creation's error is returned.
    HRESULT GetBlock(const eUserDataBlockType& type, CUserDataBlock** block, bool create);

    // The collection persists nothing of its own: S_FALSE.
    HRESULT Save(IStream* stream);
    HRESULT Load(IStream* stream);

protected:
    // Releases every block, in type order, and empties the collection.
    void Clear();

private:
    CUserDataBlocks(const CUserDataBlocks&) = delete;
    CUserDataBlocks& operator=(const CUserDataBlocks&) = delete;

    std::map<eUserDataBlockType, ut::ComPtr<CUserDataBlock>> blocks_;
};
