// User data blocks: CUserDataBlock and the CUserDataBlocks collection.
#include <new>

#include <ut/persist.h>
#include <ut/platform/detail/boundary.h>
#include <ut/sdk/objects.h>

HRESULT CUserDataBlock::QueryInterface(REFIID iid, void** object) {
    if (!object)
        return E_POINTER;
    *object = nullptr;
    if (!IsEqualGUID(iid, IID_CUserDataBlock))
        return CGWCOMObject::QueryInterface(iid, object);
    *object = this;
    AddRef();
    return S_OK;
}

CUserDataBlock::~CUserDataBlock() = default;

void CUserDataBlock::OnFinalRelease() {
    CGWCOMObject::OnFinalRelease();
}

bool CUserDataBlock::IsPersistable() const {
    return true;
}

HRESULT CUserDataBlock::Load(IStream*) {
    return E_NOTIMPL;
}

HRESULT CUserDataBlock::OnEndLoad() {
    return E_NOTIMPL;
}

HRESULT CUserDataBlock::Save(IStream*) {
    return E_NOTIMPL;
}

HRESULT CUserDataBlock::GetAsTextVersion(std::map<CKXString, CKXString>&) {
    return E_NOTIMPL;
}

HRESULT CUserDataBlock::SetFromTextVersion(std::map<CKXString, CKXString>&) {
    return E_NOTIMPL;
}

HRESULT CUserDataBlock::GetType(eUserDataBlockType& type) {
    type = eUserDataBlockTypeBase;
    return S_OK;
}

HRESULT CUserDataBlock::GetCLSIDFromType(const eUserDataBlockType& type, CLSID& clsid) {
    switch (type) {
    case eUserDataBlockType0:
        clsid = CLSID_UserDataBlockType0;
        return S_OK;
    case eUserDataBlockType1:
        clsid = CLSID_UserDataBlockType1;
        return S_OK;
    default:
        return E_UNEXPECTED;
    }
}

CUserDataBlocks::~CUserDataBlocks() {
    Clear();
}

HRESULT CUserDataBlocks::GetBlock(const eUserDataBlockType& type, CUserDataBlock** block, bool create) {
    if (!block)
        return E_POINTER;
    if (auto found = blocks_.find(type); found != blocks_.end()) {
        *block = found->second.Get();
        return S_OK;
    }
    CLSID clsid;
    if (FAILED(CUserDataBlock::GetCLSIDFromType(type, clsid)))
        return E_UNEXPECTED;
    if (!create)
        return S_FALSE;
    ut::ComPtr<CUserDataBlock> created;
    if (HRESULT hr = KXCreateInstance(clsid, IID_CUserDataBlock, created.PutVoid()); FAILED(hr))
        return hr;
    if (HRESULT hr = ut::ExportBoundary([&] {
            blocks_.emplace(type, created);
            return S_OK;
        });
        FAILED(hr))
        return hr;
    *block = created.Get();
    return S_FALSE;
}

HRESULT CUserDataBlocks::Save(IStream*) {
    return S_FALSE;
}

HRESULT CUserDataBlocks::Load(IStream*) {
    return S_FALSE;
}

void CUserDataBlocks::Clear() {
    for (auto& entry : blocks_)
        entry.second.Reset();
    blocks_.clear();
}
