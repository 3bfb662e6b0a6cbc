// Structured storage on POSIX: IStorage, its streams and its element lists over a Document, and
// the Stg* calls that open and create compound files on files and byte arrays.
#include <algorithm>
#include <cstring>
#include <new>
#include <unistd.h>

#include <ut/platform/detail/boundary.h>
#include <ut/platform/files.h>

#include "common/list_enumerator.h"
#include "common/stream_base.h"
#include "posix/lockbytes.h"
#include "posix/path.h"
#include "posix/storage_document.h"

namespace ut::platform::posix {
namespace {

constexpr DWORD kShareMask = 0x70;
constexpr ULONGLONG kMaxStreamSize = 0xFFFFFFFFull;
constexpr std::uint8_t kSignature[8] = {0xD0, 0xCF, 0x11, 0xE0, 0xA1, 0xB1, 0x1A, 0xE1};

bool CanWrite(DWORD mode) {
    return (mode & 3) != STGM_READ;
}

// Whether an element may be opened with `wanted` access inside a storage opened with `held`.
bool AccessWithin(DWORD wanted, DWORD held) {
    return (held & 3) == STGM_READWRITE || (wanted & 3) == (held & 3);
}

// The rules for a root's mode: a known access, no conversion, and in direct mode a share mode
// that keeps writers out (and, for writing, readers too).
HRESULT CheckRootMode(DWORD mode, bool create) {
    DWORD access = mode & 3;
    if (access == 3 || (mode & (STGM_CONVERT | STGM_SIMPLE)))
        return STG_E_INVALIDFLAG;
    if (create ? access == STGM_READ : (mode & (STGM_CREATE | STGM_DELETEONRELEASE)) != 0)
        return STG_E_INVALIDFLAG;
    if (mode & STGM_TRANSACTED)
        return S_OK;
    DWORD share = mode & kShareMask;
    bool shareAllowed =
        share == STGM_SHARE_EXCLUSIVE || (access == STGM_READ && share == STGM_SHARE_DENY_WRITE);
    return shareAllowed ? S_OK : STG_E_INVALIDFLAG;
}

// The rules for an element's mode: exclusive, with a known access; streams are never transacted.
HRESULT CheckElementMode(DWORD mode, bool stream) {
    if ((mode & 3) == 3 || (mode & kShareMask) != STGM_SHARE_EXCLUSIVE ||
        (mode & (STGM_DELETEONRELEASE | STGM_CONVERT | STGM_SIMPLE | STGM_PRIORITY)))
        return STG_E_INVALIDFLAG;
    return stream && (mode & STGM_TRANSACTED) ? STG_E_INVALIDFUNCTION : S_OK;
}

wchar_t* TaskCopy(const wchar_t* text) {
    std::size_t bytes = (std::wcslen(text) + 1) * sizeof(wchar_t);
    auto* copy = static_cast<wchar_t*>(CoTaskMemAlloc(bytes));
    if (copy)
        std::memcpy(copy, text, bytes);
    return copy;
}

// Fills a STATSTG with what Stat and element lists report of a node.
HRESULT FillElementStat(const Node& node, const std::wstring& name, DWORD mode, DWORD flags, STATSTG* stat) {
    HRESULT hr = FillStatRecord(stat, flags, node.type, node.IsStorage() ? 0 : node.size, name, mode);
    stat->clsid = node.clsid;
    stat->grfStateBits = node.stateBits;
    stat->ctime = node.created;
    stat->mtime = node.modified;
    return hr;
}

bool Excluded(const std::wstring& name, SNB exclude) {
    for (; exclude && *exclude; ++exclude)
        if (NameEqual(name, *exclude))
            return true;
    return false;
}

bool ExcludesInterface(DWORD count, const IID* iids, REFIID iid) {
    for (DWORD i = 0; iids && i < count; ++i)
        if (IsEqualGUID(iids[i], iid))
            return true;
    return false;
}

class StorageStream final : public StreamBase {
public:
    StorageStream(std::shared_ptr<Document> document, std::shared_ptr<Node> node, DWORD mode,
                  ULONGLONG position = 0)
        : document_(std::move(document)), node_(std::move(node)), mode_(mode), position_(position) {
        ++node_->holders;
    }

    HRESULT STDMETHODCALLTYPE Read(void* buffer, ULONG count, ULONG* read) override {
        if (read)
            *read = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        if (!CanRead(mode_))
            return STG_E_ACCESSDENIED;
        if (position_ >= node_->size || count == 0)
            return S_OK;
        ULONG wanted = static_cast<ULONG>(std::min<ULONGLONG>(count, node_->size - position_));
        if (HRESULT hr = node_->Changed() ? document_->ReadChanged(*node_, position_, buffer, wanted)
                                          : ReadFromFile(buffer, wanted);
            FAILED(hr))
            return hr;
        position_ += wanted;
        if (read)
            *read = wanted;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Write(const void* buffer, ULONG count, ULONG* written) override {
        if (written)
            *written = 0;
        if (!buffer && count)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (count == 0)
            return S_OK;
        if (position_ + count > kMaxStreamSize)
            return STG_E_MEDIUMFULL;
        if (HRESULT hr = document_->Materialize(*node_); FAILED(hr))
            return hr;
        if (HRESULT hr =
                document_->WriteChanged(*node_, position_, static_cast<const std::uint8_t*>(buffer), count);
            FAILED(hr))
            return hr;
        position_ += count;
        if (written)
            *written = count;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Seek(LARGE_INTEGER move, DWORD origin, ULARGE_INTEGER* position) override {
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        ULONGLONG target = 0;
        if (!NewPosition(move, origin, position_, node_->size, target))
            return STG_E_INVALIDFUNCTION;
        position_ = target;
        if (position)
            position->QuadPart = position_;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetSize(ULARGE_INTEGER size) override {
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        if (!CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (size.QuadPart > kMaxStreamSize)
            return STG_E_MEDIUMFULL;
        return Resize(size.QuadPart);
    }

    HRESULT STDMETHODCALLTYPE Commit(DWORD) override { return Usable(); }
    HRESULT STDMETHODCALLTYPE Revert() override { return Usable(); }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        if (!stat)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return ut::ExportBoundary([&] { return FillStat(stat, flags, node_->size, node_->name, mode_); });
    }

    HRESULT STDMETHODCALLTYPE Clone(IStream** clone) override {
        if (!clone)
            return STG_E_INVALIDPOINTER;
        *clone = nullptr;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        *clone = new (std::nothrow) StorageStream(document_, node_, mode_, position_);
        return *clone ? S_OK : E_OUTOFMEMORY;
    }

private:
    ~StorageStream() override {
        if (--node_->holders == 0)
            document_->Settle(*node_);
    }

    HRESULT Usable() const { return document_->Closed() || node_->gone ? STG_E_REVERTED : S_OK; }

    HRESULT Resize(ULONGLONG size) {
        if (HRESULT hr = document_->Materialize(*node_); FAILED(hr))
            return hr;
        return document_->ResizeChanged(*node_, size);
    }

    // Reads from the stream's bytes in the file, through an input kept while the file stays.
    HRESULT ReadFromFile(void* buffer, ULONG count) {
        if (!source_ || sourceGeneration_ != document_->Generation()) {
            if (HRESULT hr = document_->CheckSource(*node_); FAILED(hr))
                return hr;
            source_ = document_->OpenSource(*node_);
            sourceGeneration_ = document_->Generation();
            if (!source_)
                return STG_E_DOCFILECORRUPT;
        }
        return GsfReadAt(source_.get(), position_, buffer, count);
    }

    std::shared_ptr<Document> document_;
    std::shared_ptr<Node> node_;
    DWORD mode_;
    ULONGLONG position_;
    GsfOwner<GsfInput> source_;
    std::uint64_t sourceGeneration_ = 0;
};

// A storage's elements as they were when the list was asked for.
class ElementList final : public ListEnumerator<ElementList, IEnumSTATSTG, STATSTG> {
public:
    using ListEnumerator::ListEnumerator;

    static constexpr HRESULT kNullArray = STG_E_INVALIDPOINTER;
    static bool CopyOut(const STATSTG& from, STATSTG& to) {
        to = from;
        to.pwcsName = TaskCopy(from.pwcsName);
        return to.pwcsName != nullptr;
    }
    static void Discard(STATSTG& element) { CoTaskMemFree(element.pwcsName); }
};

void FreeElements(std::vector<STATSTG>* elements) {
    for (STATSTG& element : *elements)
        CoTaskMemFree(element.pwcsName);
    delete elements;
}

class StorageObject final : public Object<IStorage> {
public:
    StorageObject(std::shared_ptr<Document> document, std::shared_ptr<Node> node, DWORD mode, bool root)
        : document_(std::move(document)), node_(std::move(node)), mode_(mode & ~(STGM_CREATE | STGM_CONVERT)),
          root_(root) {
        ++node_->holders;
    }

    HRESULT STDMETHODCALLTYPE CreateStream(const OLECHAR* name, DWORD mode, DWORD reserved1, DWORD reserved2,
                                           IStream** stream) override {
        if (!stream)
            return STG_E_INVALIDPOINTER;
        *stream = nullptr;
        std::shared_ptr<Node> node;
        HRESULT hr = CreateElement(name, mode, reserved1 || reserved2, STGTY_STREAM, node);
        if (FAILED(hr))
            return hr;
        *stream = new (std::nothrow) StorageStream(document_, node, mode);
        return *stream ? S_OK : E_OUTOFMEMORY;
    }

    HRESULT STDMETHODCALLTYPE OpenStream(const OLECHAR* name, void* reserved1, DWORD mode, DWORD reserved2,
                                         IStream** stream) override {
        if (!stream)
            return STG_E_INVALIDPOINTER;
        *stream = nullptr;
        std::shared_ptr<Node> node;
        HRESULT hr = FindElement(name, mode, reserved1 || reserved2, STGTY_STREAM, node);
        if (FAILED(hr))
            return hr;
        *stream = new (std::nothrow) StorageStream(document_, node, mode);
        return *stream ? S_OK : E_OUTOFMEMORY;
    }

    HRESULT STDMETHODCALLTYPE CreateStorage(const OLECHAR* name, DWORD mode, DWORD reserved1, DWORD reserved2,
                                            IStorage** storage) override {
        if (!storage)
            return STG_E_INVALIDPOINTER;
        *storage = nullptr;
        std::shared_ptr<Node> node;
        HRESULT hr = CreateElement(name, mode, reserved1 || reserved2, STGTY_STORAGE, node);
        if (FAILED(hr))
            return hr;
        *storage = new (std::nothrow) StorageObject(document_, node, mode, false);
        return *storage ? S_OK : E_OUTOFMEMORY;
    }

    HRESULT STDMETHODCALLTYPE OpenStorage(const OLECHAR* name, IStorage*, DWORD mode, SNB exclude,
                                          DWORD reserved, IStorage** storage) override {
        if (!storage)
            return STG_E_INVALIDPOINTER;
        *storage = nullptr;
        std::shared_ptr<Node> node;
        HRESULT hr = FindElement(name, mode, reserved != 0, STGTY_STORAGE, node);
        if (FAILED(hr))
            return hr;
        return ut::ExportBoundary([&] {
            if (exclude && CanWrite(mode))
                document_->Exclude(*node, exclude);
            *storage = new StorageObject(document_, node, mode, false);
            return S_OK;
        });
    }

    HRESULT STDMETHODCALLTYPE CopyTo(DWORD excludedCount, const IID* excludedIids, SNB exclude,
                                     IStorage* target) override {
        if (!target)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        if (Contains(target))
            return STG_E_ACCESSDENIED;
        return ut::ExportBoundary([&] {
            bool streams = !ExcludesInterface(excludedCount, excludedIids, IID_IStream);
            bool storages = !ExcludesInterface(excludedCount, excludedIids, IID_IStorage);
            return CopyStorage(*node_, target, exclude, streams, storages);
        });
    }

    HRESULT STDMETHODCALLTYPE MoveElementTo(const OLECHAR* name, IStorage* target, const OLECHAR* newName,
                                            DWORD flags) override {
        if (!name || !newName)
            return STG_E_INVALIDNAME;
        if (!target)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        std::shared_ptr<Node> node = node_->Find(name);
        if (!node)
            return STG_E_FILENOTFOUND;
        if (flags == STGMOVE_MOVE && !CanWrite(mode_))
            return STG_E_ACCESSDENIED;
        if (node->IsStorage() && Contains(target))
            return STG_E_ACCESSDENIED;
        HRESULT hr = ut::ExportBoundary([&] { return CopyElement(*node, target, newName, true, true); });
        return SUCCEEDED(hr) && flags == STGMOVE_MOVE ? DestroyElement(name) : hr;
    }

    HRESULT STDMETHODCALLTYPE Commit(DWORD) override {
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return root_ ? document_->Commit() : S_OK;
    }

    HRESULT STDMETHODCALLTYPE Revert() override {
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return root_ ? document_->Revert() : S_OK;
    }

    HRESULT STDMETHODCALLTYPE EnumElements(DWORD reserved1, void* reserved2, DWORD reserved3,
                                           IEnumSTATSTG** elements) override {
        if (!elements)
            return STG_E_INVALIDPOINTER;
        *elements = nullptr;
        if (reserved1 || reserved2 || reserved3)
            return STG_E_INVALIDPARAMETER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return ut::ExportBoundary([&] {
            std::shared_ptr<ElementList::Items> list(new ElementList::Items, FreeElements);
            for (const std::shared_ptr<Node>& child : node_->children) {
                if (HRESULT hr =
                        FillElementStat(*child, child->name, 0, STATFLAG_DEFAULT, &list->emplace_back());
                    FAILED(hr))
                    return hr;
            }
            *elements = new ElementList(std::move(list), 0);
            return S_OK;
        });
    }

    HRESULT STDMETHODCALLTYPE DestroyElement(const OLECHAR* name) override {
        std::shared_ptr<Node> node;
        if (HRESULT hr = ChangeableElement(name, node); FAILED(hr))
            return hr;
        MarkGone(*node);
        node_->Remove(node.get());
        document_->Touch();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE RenameElement(const OLECHAR* oldName, const OLECHAR* newName) override {
        if (!newName || !ValidElementName(newName))
            return STG_E_INVALIDNAME;
        std::shared_ptr<Node> node;
        if (HRESULT hr = ChangeableElement(oldName, node); FAILED(hr))
            return hr;
        std::shared_ptr<Node> clash = node_->Find(newName);
        if (clash && clash != node)
            return STG_E_FILEALREADYEXISTS;
        if (node->holders > 0)
            return STG_E_ACCESSDENIED;
        return ut::ExportBoundary([&] {
            node_->Remove(node.get());
            node->Name(newName);
            node_->Insert(node);
            document_->Touch();
            return S_OK;
        });
    }

    HRESULT STDMETHODCALLTYPE SetElementTimes(const OLECHAR* name, const FILETIME* created, const FILETIME*,
                                              const FILETIME* modified) override {
        std::shared_ptr<Node> node = node_;
        HRESULT hr = name ? ChangeableElement(name, node) : Changeable();
        if (FAILED(hr))
            return hr;
        if (created)
            node->created = *created;
        if (modified)
            node->modified = *modified;
        document_->Touch();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetClass(REFCLSID clsid) override {
        if (HRESULT hr = Changeable(); FAILED(hr))
            return hr;
        node_->clsid = clsid;
        document_->Touch();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE SetStateBits(DWORD bits, DWORD mask) override {
        if (HRESULT hr = Changeable(); FAILED(hr))
            return hr;
        node_->stateBits = (node_->stateBits & ~mask) | (bits & mask);
        document_->Touch();
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Stat(STATSTG* stat, DWORD flags) override {
        if (!stat)
            return STG_E_INVALIDPOINTER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return ut::ExportBoundary([&] {
            return FillElementStat(*node_, root_ ? document_->Name() : node_->name, mode_, flags, stat);
        });
    }

private:
    ~StorageObject() override {
        --node_->holders;
        if (root_)
            document_->Close();
    }

    HRESULT Usable() const { return document_->Closed() || node_->gone ? STG_E_REVERTED : S_OK; }

    HRESULT Changeable() const {
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        return CanWrite(mode_) ? S_OK : STG_E_ACCESSDENIED;
    }

    // The element `name` of this storage, for a change that the storage's mode must allow.
    HRESULT ChangeableElement(const OLECHAR* name, std::shared_ptr<Node>& node) {
        if (!name)
            return STG_E_INVALIDNAME;
        if (HRESULT hr = Changeable(); FAILED(hr))
            return hr;
        node = node_->Find(name);
        return node ? S_OK : STG_E_FILENOTFOUND;
    }

    HRESULT CreateElement(const OLECHAR* name, DWORD mode, bool reserved, DWORD type,
                          std::shared_ptr<Node>& node) {
        if (!name)
            return STG_E_INVALIDNAME;
        if (HRESULT hr = CheckElementMode(mode, type == STGTY_STREAM); FAILED(hr))
            return hr;
        if (reserved)
            return STG_E_INVALIDPARAMETER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        if (!ValidElementName(name))
            return STG_E_INVALIDNAME;
        if (!CanWrite(mode_) || !AccessWithin(mode, mode_))
            return STG_E_ACCESSDENIED;
        return ut::ExportBoundary([&] {
            if (std::shared_ptr<Node> existing = node_->Find(name)) {
                if (!(mode & STGM_CREATE))
                    return STG_E_FILEALREADYEXISTS;
                MarkGone(*existing);
                node_->Remove(existing.get());
            }
            node = std::make_shared<Node>();
            node->Name(name);
            node->type = type;
            node->parent = node_.get();
            if (type == STGTY_STREAM)
                node->bytes = std::make_unique<std::vector<std::uint8_t>>();
            node_->Insert(node);
            document_->Touch();
            return S_OK;
        });
    }

    HRESULT FindElement(const OLECHAR* name, DWORD mode, bool reserved, DWORD type,
                        std::shared_ptr<Node>& node) {
        if (!name)
            return STG_E_INVALIDNAME;
        if (HRESULT hr = CheckElementMode(mode, type == STGTY_STREAM); FAILED(hr))
            return hr;
        if (reserved)
            return STG_E_INVALIDPARAMETER;
        if (HRESULT hr = Usable(); FAILED(hr))
            return hr;
        node = node_->Find(name);
        if (!node || node->type != type)
            return STG_E_FILENOTFOUND;
        if (!AccessWithin(mode, mode_) || node->holders > 0)
            return STG_E_ACCESSDENIED;
        return S_OK;
    }

    // Whether `target` is this storage or lies inside it: copying there would never end.
    bool Contains(IStorage* target) const {
        auto* storage = dynamic_cast<StorageObject*>(target);
        if (!storage || storage->document_ != document_)
            return false;
        for (const Node* node = storage->node_.get(); node; node = node->parent)
            if (node == node_.get())
                return true;
        return false;
    }

    HRESULT CopyStorage(Node& source, IStorage* target, SNB exclude, bool streams, bool storages) {
        if (HRESULT hr = target->SetClass(source.clsid); FAILED(hr))
            return hr;
        for (const std::shared_ptr<Node>& child : source.children) {
            if (Excluded(child->name, exclude))
                continue;
            if (HRESULT hr = CopyElement(*child, target, child->name.c_str(), streams, storages); FAILED(hr))
                return hr;
        }
        return S_OK;
    }

    // Copies one element into `target` under `name`: a stream replaces what is there, a storage
    // merges into a storage of that name.
    HRESULT CopyElement(Node& element, IStorage* target, const wchar_t* name, bool streams, bool storages) {
        constexpr DWORD kWriting = STGM_READWRITE | STGM_SHARE_EXCLUSIVE;
        if (!element.IsStorage()) {
            if (!streams)
                return S_OK;
            ComPtr<IStream> copy;
            if (HRESULT hr = target->CreateStream(name, kWriting | STGM_CREATE, 0, 0, copy.Put()); FAILED(hr))
                return hr;
            return document_->ReadAll(element, [&](const std::uint8_t* data, std::size_t count) {
                return copy->Write(data, static_cast<ULONG>(count), nullptr);
            });
        }
        if (!storages)
            return S_OK;
        ComPtr<IStorage> copy;
        HRESULT hr = target->OpenStorage(name, nullptr, kWriting, nullptr, 0, copy.Put());
        if (hr == STG_E_FILENOTFOUND)
            hr = target->CreateStorage(name, kWriting | STGM_CREATE, 0, 0, copy.Put());
        if (FAILED(hr))
            return hr;
        return CopyStorage(element, copy.Get(), nullptr, streams, storages);
    }

    std::shared_ptr<Document> document_;
    std::shared_ptr<Node> node_;
    DWORD mode_;
    bool root_;
};

HRESULT RootOn(std::shared_ptr<Document> document, DWORD mode, IStorage** storage) {
    *storage = new (std::nothrow) StorageObject(document, document->RootNode(), mode, true);
    if (*storage)
        return S_OK;
    document->Close();
    return E_OUTOFMEMORY;
}

std::wstring NameOf(ILockBytes* bytes) {
    STATSTG stat{};
    if (FAILED(bytes->Stat(&stat, STATFLAG_DEFAULT)) || !stat.pwcsName)
        return std::wstring();
    std::wstring name = stat.pwcsName;
    CoTaskMemFree(stat.pwcsName);
    return name;
}

// The access a file needs under a storage opened with `mode`: reading, and writing when the
// storage writes, since a commit reads what it keeps.
DWORD FileMode(DWORD mode) {
    return (CanWrite(mode) ? STGM_READWRITE : STGM_READ) | (mode & STGM_DELETEONRELEASE);
}

// A new file in the temporary folder for a storage created without a name.
HRESULT TemporaryStoragePath(std::string& path) {
    wchar_t folder[MAX_PATH];
    DWORD length = GetTempPathW(MAX_PATH, folder);
    if (length == 0 || length >= MAX_PATH)
        return STG_E_PATHNOTFOUND;
    path = SystemPath(folder) + "STOXXXXXX.tmp";
    int fd = ::mkstemps(path.data(), 4);
    if (fd < 0)
        return StorageError(errno, STG_E_WRITEFAULT);
    ::close(fd);
    return S_OK;
}

// What every call that opens or creates a root checks first: the out-parameter, what to open
// (`missing` is S_OK when it is there, else the answer), the reserved value and the mode.
HRESULT BeginRoot(IStorage** storage, HRESULT missing, DWORD reserved, DWORD mode, bool create) {
    if (!storage)
        return STG_E_INVALIDPOINTER;
    *storage = nullptr;
    if (FAILED(missing))
        return missing;
    if (reserved)
        return STG_E_INVALIDPARAMETER;
    return CheckRootMode(mode, create);
}

bool HasSignature(ILockBytes* bytes, HRESULT& hr) {
    std::uint8_t start[sizeof kSignature] = {};
    ULONG read = 0;
    ULARGE_INTEGER origin{};
    hr = bytes->ReadAt(origin, start, sizeof start, &read);
    return SUCCEEDED(hr) && read == sizeof start && std::memcmp(start, kSignature, sizeof start) == 0;
}

} // namespace
} // namespace ut::platform::posix

using namespace ut::platform::posix;

extern "C" {

HRESULT StgIsStorageILockBytes(ILockBytes* bytes) {
    if (!bytes)
        return STG_E_INVALIDPOINTER;
    HRESULT hr = S_OK;
    bool compound = HasSignature(bytes, hr);
    return FAILED(hr) ? hr : compound ? S_OK : S_FALSE;
}

HRESULT StgIsStorageFile(const OLECHAR* name) {
    if (!name)
        return STG_E_INVALIDNAME;
    return ut::ExportBoundary([&] {
        ut::ComPtr<ILockBytes> bytes;
        HRESULT hr = OpenFileBytes(SystemPath(name), STGM_READ, Disposition::Existing, bytes.Put());
        if (hr == STG_E_ACCESSDENIED || hr == STG_E_PATHNOTFOUND)
            return STG_E_FILENOTFOUND;
        return FAILED(hr) ? hr : StgIsStorageILockBytes(bytes.Get());
    });
}

HRESULT StgOpenStorageOnILockBytes(ILockBytes* bytes, IStorage*, DWORD mode, SNB exclude, DWORD reserved,
                                   IStorage** storage) {
    if (HRESULT hr = BeginRoot(storage, bytes ? S_OK : STG_E_INVALIDPOINTER, reserved, mode, false);
        FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::shared_ptr<Document> document;
        if (HRESULT hr = Document::Open(bytes, mode, NameOf(bytes), exclude, document); FAILED(hr))
            return hr;
        return RootOn(std::move(document), mode, storage);
    });
}

HRESULT StgCreateDocfileOnILockBytes(ILockBytes* bytes, DWORD mode, DWORD reserved, IStorage** storage) {
    if (HRESULT hr = BeginRoot(storage, bytes ? S_OK : STG_E_INVALIDPOINTER, reserved, mode, true);
        FAILED(hr))
        return hr;
    STATSTG stat{};
    if (HRESULT hr = bytes->Stat(&stat, STATFLAG_NONAME); FAILED(hr))
        return hr;
    if (stat.cbSize.QuadPart > 0 && !(mode & STGM_CREATE))
        return STG_E_FILEALREADYEXISTS;
    DWORD kept = mode & ~STGM_DELETEONRELEASE; // the byte array decides what becomes of its bytes
    return ut::ExportBoundary([&] {
        std::shared_ptr<Document> document;
        if (HRESULT hr = Document::Create(bytes, kept, NameOf(bytes), document); FAILED(hr))
            return hr;
        return RootOn(std::move(document), kept, storage);
    });
}

HRESULT StgOpenStorage(const OLECHAR* name, IStorage* priority, DWORD mode, SNB exclude, DWORD reserved,
                       IStorage** storage) {
    if (HRESULT hr = BeginRoot(storage, name ? S_OK : STG_E_INVALIDNAME, reserved, mode, false); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        ut::ComPtr<ILockBytes> bytes;
        HRESULT hr = OpenFileBytes(SystemPath(name), FileMode(mode), Disposition::Existing, bytes.Put());
        if (FAILED(hr))
            return hr == STG_E_PATHNOTFOUND ? STG_E_FILENOTFOUND : hr;
        return StgOpenStorageOnILockBytes(bytes.Get(), priority, mode, exclude, 0, storage);
    });
}

HRESULT StgCreateDocfile(const OLECHAR* name, DWORD mode, DWORD reserved, IStorage** storage) {
    // A null name makes a temporary file; an empty one names nothing.
    HRESULT named = name && !*name ? STG_E_INVALIDNAME : S_OK;
    if (HRESULT hr = BeginRoot(storage, named, reserved, mode, true); FAILED(hr))
        return hr;
    return ut::ExportBoundary([&] {
        std::string path;
        auto disposition = (mode & STGM_CREATE) ? Disposition::OpenOrCreate : Disposition::CreateNew;
        if (name) {
            path = SystemPath(name);
        } else if (HRESULT hr = TemporaryStoragePath(path); FAILED(hr)) {
            return hr;
        } else {
            disposition = Disposition::Existing;
        }
        ut::ComPtr<ILockBytes> bytes;
        if (HRESULT hr = OpenFileBytes(path, FileMode(mode), disposition, bytes.Put()); FAILED(hr))
            return hr;
        std::shared_ptr<Document> document;
        if (HRESULT hr = Document::Create(bytes.Get(), mode, NameOf(bytes.Get()), document); FAILED(hr))
            return hr;
        return RootOn(std::move(document), mode, storage);
    });
}

} // extern "C"
