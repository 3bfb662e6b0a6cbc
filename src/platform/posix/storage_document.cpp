// The POSIX compound-file document: reading the tree, writing it back through libgsf, and
// giving the written directory balanced trees and the attributes libgsf does not write.
#include "posix/storage_document.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <gsf/gsf-outfile-msole.h>
#include <gsf/gsf-output-stdio.h>
#include <unistd.h>

#include <ut/platform/detail/boundary.h>

#include "posix/descriptor.h"
#include "posix/lockbytes.h"
#include "posix/path.h"

namespace ut::platform::posix {
namespace {

constexpr std::size_t kCopyChunk = 1 << 20;

HRESULT WriteFailure() {
    return errno == ENOSPC || errno == EFBIG ? STG_E_MEDIUMFULL : STG_E_WRITEFAULT;
}

void PutLe32(std::uint8_t* p, std::uint32_t value) {
    for (int i = 0; i < 4; ++i)
        p[i] = static_cast<std::uint8_t>(value >> (8 * i));
}

// The fields of a directory entry that the document writes itself.
struct EntryPatch {
    std::uint32_t left = kNoEntry;
    std::uint32_t right = kNoEntry;
    std::uint32_t child = kNoEntry;
    bool red = false;
    const Node* node = nullptr;
};

void ApplyPatch(const EntryPatch& patch, std::uint8_t* raw) {
    raw[67] = patch.red ? 0 : 1;
    PutLe32(raw + 68, patch.left);
    PutLe32(raw + 72, patch.right);
    PutLe32(raw + 76, patch.child);
    std::memcpy(raw + 80, &patch.node->clsid, sizeof(CLSID));
    PutLe32(raw + 96, patch.node->stateBits);
    PutLe32(raw + 100, patch.node->created.dwLowDateTime);
    PutLe32(raw + 104, patch.node->created.dwHighDateTime);
    PutLe32(raw + 108, patch.node->modified.dwLowDateTime);
    PutLe32(raw + 112, patch.node->modified.dwHighDateTime);
}

// Links the sorted `entries[first, last)` as a balanced red-black tree and returns its root.
// Splitting at the middle leaves every path to a leaf within one level of the others, so the
// tree is valid with the nodes of an incomplete last level red and all others black.
std::uint32_t Balance(const std::vector<std::uint32_t>& entries, std::size_t first, std::size_t last,
                      std::size_t level, std::size_t redLevel, std::vector<EntryPatch>& patches) {
    if (first >= last)
        return kNoEntry;
    std::size_t middle = first + (last - first) / 2;
    EntryPatch& patch = patches[entries[middle]];
    patch.red = level == redLevel;
    patch.left = Balance(entries, first, middle, level + 1, redLevel, patches);
    patch.right = Balance(entries, middle + 1, last, level + 1, redLevel, patches);
    return entries[middle];
}

std::uint32_t BalancedTree(const std::vector<std::uint32_t>& entries, std::vector<EntryPatch>& patches) {
    std::size_t levels = 0;
    while ((std::size_t{1} << levels) - 1 < entries.size())
        ++levels;
    bool complete = entries.size() == (std::size_t{1} << levels) - 1;
    std::size_t redLevel = complete ? levels : levels - 1;
    return Balance(entries, 0, entries.size(), 0, redLevel, patches);
}

// Collects the patches of a storage's elements, matching the written entries to the nodes.
HRESULT PlanStorage(const CompoundFile& layout, std::uint32_t entry, const Node& storage,
                    std::vector<EntryPatch>& patches) {
    patches[entry].node = &storage;
    const std::vector<std::uint32_t>& elements = layout.Children(entry);
    patches[entry].child = BalancedTree(elements, patches);
    for (std::uint32_t element : elements) {
        std::shared_ptr<Node> node = storage.Find(layout.Entry(element).key);
        if (!node)
            return STG_E_DOCFILECORRUPT;
        if (!node->IsStorage()) {
            patches[element].node = node.get();
            continue;
        }
        if (HRESULT hr = PlanStorage(layout, element, *node, patches); FAILED(hr))
            return hr;
    }
    return S_OK;
}

// Reads or writes all of `count` bytes; a short read means the written file lost its end.
HRESULT ReadFull(int fd, ULONGLONG offset, std::uint8_t* buffer, std::size_t count) {
    std::size_t done = 0;
    HRESULT hr = PreadFully(fd, offset, buffer, count, done);
    return FAILED(hr) || done == count ? hr : STG_E_READFAULT;
}

HRESULT WriteFull(int fd, ULONGLONG offset, const std::uint8_t* buffer, std::size_t count) {
    std::size_t done = 0;
    return PwriteFully(fd, offset, buffer, count, done);
}

} // namespace

namespace {

auto Place(const std::vector<std::shared_ptr<Node>>& children, const NameKey& key) {
    return std::lower_bound(
        children.begin(), children.end(), key,
        [](const std::shared_ptr<Node>& child, const NameKey& wanted) { return child->key < wanted; });
}

} // namespace

std::shared_ptr<Node> Node::Find(const NameKey& wanted) const {
    auto found = Place(children, wanted);
    return found != children.end() && (*found)->key == wanted ? *found : nullptr;
}

void Node::Insert(std::shared_ptr<Node> child) {
    auto at = Place(children, child->key);
    children.insert(at, std::move(child));
}

void Node::Remove(const Node* child) {
    std::erase_if(children, [&](const std::shared_ptr<Node>& element) { return element.get() == child; });
}

void MarkGone(Node& node) {
    node.gone = true;
    node.reader.reset();
    for (std::shared_ptr<Node>& child : node.children)
        MarkGone(*child);
}

bool ValidElementName(const wchar_t* name) {
    std::size_t length = Utf16Length(name);
    return length > 0 && length <= 31 && !std::wcspbrk(name, L"\\/:!");
}

Document::Document(ILockBytes* bytes, DWORD mode, std::wstring name)
    : bytes_(bytes), mode_(mode), name_(std::move(name)), root_(std::make_shared<Node>()) {
    root_->type = STGTY_STORAGE;
}

HRESULT Document::Open(ILockBytes* bytes, DWORD mode, std::wstring name, SNB exclude,
                       std::shared_ptr<Document>& document) {
    return ut::ExportBoundary([&] {
        std::shared_ptr<Document> opened(new Document(bytes, mode, std::move(name)));
        if (HRESULT hr = opened->Load(); FAILED(hr))
            return hr;
        opened->Adopt(opened->Root(), 0);
        opened->BuildChildren(opened->Root());
        opened->Exclude(opened->Root(), exclude);
        document = std::move(opened);
        return S_OK;
    });
}

HRESULT Document::Create(ILockBytes* bytes, DWORD mode, std::wstring name,
                         std::shared_ptr<Document>& document) {
    return ut::ExportBoundary([&] {
        std::shared_ptr<Document> created(new Document(bytes, mode, std::move(name)));
        // An empty storage needs no flush: what it replaces was given up by creating it.
        if (HRESULT hr = created->Commit(false); FAILED(hr))
            return hr;
        document = std::move(created);
        return S_OK;
    });
}

HRESULT Document::Load() {
    reader_.reset();
    layout_.reset();
    ++generation_;
    if (HRESULT hr = CompoundFile::Open(bytes_.Get(), kMaxTreeDepth, layout_); FAILED(hr))
        return hr;
    STATSTG stat{};
    if (HRESULT hr = bytes_->Stat(&stat, STATFLAG_NONAME); FAILED(hr))
        return hr;
    return OpenGsfReader(bytes_.Get(), stat.cbSize.QuadPart, reader_);
}

// Takes a node's place and attributes from its entry in the file just read.
void Document::Adopt(Node& node, std::uint32_t entry) {
    const DirectoryEntry& found = layout_->Entry(entry);
    node.entry = entry;
    node.sourceName = found.utf8Name;
    node.sourceKey = found.key;
    node.inFile = true;
    node.clsid = found.clsid;
    node.stateBits = found.stateBits;
    node.created = found.created;
    node.modified = found.modified;
    if (!node.IsStorage())
        node.size = found.size;
}

void Document::BuildChildren(Node& storage) {
    for (std::uint32_t element : layout_->Children(storage.entry)) {
        const DirectoryEntry& found = layout_->Entry(element);
        auto node = std::make_shared<Node>();
        node->name = found.name;
        node->key = found.key;
        node->type = found.type == EntryType::Storage ? STGTY_STORAGE : STGTY_STREAM;
        node->parent = &storage;
        Adopt(*node, element);
        if (node->IsStorage())
            BuildChildren(*node);
        storage.children.push_back(std::move(node));
    }
}

// After a commit the file holds the tree as it stands: streams that no interface holds drop
// their bytes, and each node is found again in the file by its present name when it is read.
void Document::Rebase(Node& node) {
    node.entry = kNoEntry;
    node.sourceName = Utf8FromWide(node.name);
    node.sourceKey = node.key;
    node.inFile = true;
    node.reader.reset();
    if (!node.IsStorage()) {
        if (node.holders == 0)
            node.bytes.reset();
        return;
    }
    for (std::shared_ptr<Node>& child : node.children)
        Rebase(*child);
}

// Finds the entries of the nodes the file holds; nodes made since the commit have none.
void Document::Locate(Node& node, std::uint32_t entry) {
    node.entry = entry;
    for (std::shared_ptr<Node>& child : node.children) {
        std::uint32_t element = child->inFile ? layout_->Find(entry, child->sourceKey) : kNoEntry;
        if (element != kNoEntry)
            Locate(*child, element);
    }
}

// The file is read again only when something is read from it after a commit.
HRESULT Document::EnsureLoaded() {
    if (layout_)
        return S_OK;
    if (HRESULT hr = Load(); FAILED(hr))
        return hr;
    Locate(*root_, 0);
    return S_OK;
}

void Document::Exclude(Node& storage, SNB names) {
    for (; names && *names; ++names) {
        std::shared_ptr<Node> node = storage.Find(*names);
        if (!node)
            continue;
        for (std::shared_ptr<Node>& child : node->children)
            MarkGone(*child);
        node->children.clear();
        node->bytes = std::make_unique<std::vector<std::uint8_t>>();
        node->size = 0;
        dirty_ = true;
    }
}

GsfInfile* Document::ReaderOf(Node& storage) {
    if (&storage == root_.get())
        return reader_.get();
    if (!storage.reader && storage.parent) {
        GsfInfile* parent = ReaderOf(*storage.parent);
        GsfOwner<GsfInput> child = parent ? GsfChild(parent, storage.sourceName) : nullptr;
        if (child && GSF_IS_INFILE(child.get()))
            storage.reader.reset(GSF_INFILE(child.release()));
    }
    return storage.reader.get();
}

HRESULT Document::CheckSource(const Node& stream) {
    if (HRESULT hr = EnsureLoaded(); FAILED(hr))
        return hr;
    if (stream.entry == kNoEntry)
        return STG_E_DOCFILECORRUPT;
    return layout_->CheckStream(stream.entry);
}

GsfOwner<GsfInput> Document::OpenSource(Node& stream) {
    GsfInfile* storage = stream.parent ? ReaderOf(*stream.parent) : nullptr;
    return storage ? GsfChild(storage, stream.sourceName) : nullptr;
}

HRESULT Document::Materialize(Node& stream) {
    if (stream.bytes)
        return S_OK;
    return ut::ExportBoundary([&] {
        auto bytes = std::make_unique<std::vector<std::uint8_t>>(stream.size);
        if (stream.size > 0) {
            if (HRESULT hr = CheckSource(stream); FAILED(hr))
                return hr;
            GsfOwner<GsfInput> source = OpenSource(stream);
            if (!source)
                return STG_E_DOCFILECORRUPT;
            if (HRESULT hr = GsfReadAt(source.get(), 0, bytes->data(), bytes->size()); FAILED(hr))
                return hr;
        }
        stream.bytes = std::move(bytes);
        return S_OK;
    });
}

HRESULT Document::Commit(bool durable) {
    if (closed_)
        return STG_E_REVERTED;
    if (!Writable())
        return STG_E_ACCESSDENIED;
    return ut::ExportBoundary([&] {
        FileBytes* file = FileBehind(bytes_.Get());
        HRESULT hr =
            file ? file->ReplaceContent([this](std::FILE* target) { return WriteImage(target); }, durable)
                 : WriteThroughScratch(durable);
        if (FAILED(hr))
            return hr;
        Rebase(*root_);
        reader_.reset();
        layout_.reset();
        ++generation_;
        dirty_ = false;
        return S_OK;
    });
}

HRESULT Document::Revert() {
    if (closed_)
        return STG_E_REVERTED;
    if (!(mode_ & STGM_TRANSACTED))
        return S_OK;
    return ut::ExportBoundary([&] {
        if (HRESULT hr = EnsureLoaded(); FAILED(hr))
            return hr;
        for (std::shared_ptr<Node>& child : root_->children)
            MarkGone(*child);
        root_->children.clear();
        Adopt(*root_, 0);
        BuildChildren(*root_);
        dirty_ = false;
        return S_OK;
    });
}

void Document::Close() {
    if (closed_)
        return;
    bool direct = !(mode_ & STGM_TRANSACTED);
    bool discarded = mode_ & STGM_DELETEONRELEASE;
    if (direct && dirty_ && Writable() && !discarded)
        (void)Commit(); // the root's last release has nobody to tell of a failure
    closed_ = true;
    MarkGone(*root_);
    root_->children.clear();
    reader_.reset();
    layout_.reset();
    bytes_.Reset();
}

HRESULT Document::WriteThroughScratch(bool durable) {
    std::FILE* scratch = nullptr;
    if (HRESULT hr = CreateScratchFile(&scratch); FAILED(hr))
        return hr;
    std::unique_ptr<std::FILE, int (*)(std::FILE*)> owner(scratch, std::fclose);
    if (HRESULT hr = WriteImage(scratch); FAILED(hr))
        return hr;
    int fd = ::fileno(scratch);
    off_t size = ::lseek(fd, 0, SEEK_END);
    std::vector<std::uint8_t> chunk(kCopyChunk);
    for (ULONGLONG at = 0; at < static_cast<ULONGLONG>(size);) {
        std::size_t count = std::min<ULONGLONG>(chunk.size(), static_cast<ULONGLONG>(size) - at);
        if (HRESULT hr = ReadFull(fd, at, chunk.data(), count); FAILED(hr))
            return hr;
        ULARGE_INTEGER offset{};
        offset.QuadPart = at;
        ULONG written = 0;
        if (HRESULT hr = bytes_->WriteAt(offset, chunk.data(), static_cast<ULONG>(count), &written);
            FAILED(hr))
            return hr;
        at += count;
    }
    ULARGE_INTEGER total{};
    total.QuadPart = static_cast<ULONGLONG>(size);
    if (HRESULT hr = bytes_->SetSize(total); FAILED(hr))
        return hr;
    return durable ? bytes_->Flush() : S_OK;
}

HRESULT Document::WriteImage(std::FILE* file) {
    GsfOwner<GsfOutput> sink(gsf_output_stdio_new_FILE("", file, TRUE));
    GsfOwner<GsfOutfile> root(sink ? gsf_outfile_msole_new(sink.get()) : nullptr);
    if (!root)
        return E_OUTOFMEMORY;
    HRESULT hr = WriteElements(*root_, root.get());
    bool closed = gsf_output_close(GSF_OUTPUT(root.get()));
    root.reset();
    // Closing the compound file closes its sink as well, where libgsf does so.
    closed = (gsf_output_is_closed(sink.get()) || gsf_output_close(sink.get())) && closed;
    sink.reset();
    if (SUCCEEDED(hr) && (!closed || std::fflush(file) != 0))
        hr = WriteFailure();
    return SUCCEEDED(hr) ? PatchDirectory(::fileno(file)) : hr;
}

HRESULT Document::WriteElements(Node& storage, GsfOutfile* target) {
    for (std::shared_ptr<Node>& element : storage.children) {
        std::string name = Utf8FromWide(element->name);
        GsfOwner<GsfOutput> child(gsf_outfile_new_child(target, name.c_str(), element->IsStorage()));
        if (!child)
            return STG_E_WRITEFAULT;
        HRESULT hr = element->IsStorage() ? WriteElements(*element, GSF_OUTFILE(child.get()))
                                          : WriteStream(*element, child.get());
        if (!gsf_output_close(child.get()) && SUCCEEDED(hr))
            hr = WriteFailure();
        if (FAILED(hr))
            return hr;
    }
    return S_OK;
}

HRESULT Document::WriteStream(Node& stream, GsfOutput* target) {
    if (stream.size == 0)
        return S_OK;
    if (stream.bytes)
        return gsf_output_write(target, stream.bytes->size(), stream.bytes->data()) ? S_OK : WriteFailure();
    if (HRESULT hr = CheckSource(stream); FAILED(hr))
        return hr;
    GsfOwner<GsfInput> source = OpenSource(stream);
    if (!source)
        return STG_E_DOCFILECORRUPT;
    std::vector<std::uint8_t> chunk(std::min<ULONGLONG>(kCopyChunk, stream.size));
    for (ULONGLONG at = 0; at < stream.size;) {
        std::size_t count = std::min<ULONGLONG>(chunk.size(), stream.size - at);
        if (HRESULT hr = GsfReadAt(source.get(), at, chunk.data(), count); FAILED(hr))
            return hr;
        if (!gsf_output_write(target, count, chunk.data()))
            return WriteFailure();
        at += count;
    }
    return S_OK;
}

// libgsf links each storage's elements as one long list and writes neither state bits nor
// times: relink them as balanced trees and write what the nodes hold, sector by sector.
HRESULT Document::PatchDirectory(int fd) {
    ComPtr<ILockBytes> written;
    if (HRESULT hr = WrapDescriptor(fd, written.Put()); FAILED(hr))
        return hr;
    std::unique_ptr<CompoundFile> layout;
    if (HRESULT hr = CompoundFile::Open(written.Get(), 0xFFFFFFFF, layout); FAILED(hr))
        return hr;
    std::vector<EntryPatch> patches(layout->EntryCount());
    if (HRESULT hr = PlanStorage(*layout, 0, *root_, patches); FAILED(hr))
        return hr;
    // Sectors that follow each other in the file are read, patched and written as one run.
    std::uint32_t perSector = layout->SectorSize() / kDirectoryEntrySize;
    std::vector<std::uint8_t> run;
    for (std::uint32_t first = 0; first < layout->EntryCount();) {
        ULONGLONG offset = layout->EntryOffset(first);
        std::uint32_t last = first + perSector;
        while (last < layout->EntryCount() && last - first < kCopyChunk / kDirectoryEntrySize &&
               layout->EntryOffset(last) == offset + (last - first) * kDirectoryEntrySize)
            last += perSector;
        run.resize(static_cast<std::size_t>(last - first) * kDirectoryEntrySize);
        if (HRESULT hr = ReadFull(fd, offset, run.data(), run.size()); FAILED(hr))
            return hr;
        for (std::uint32_t i = first; i < last; ++i)
            if (patches[i].node)
                ApplyPatch(patches[i],
                           run.data() + static_cast<std::size_t>(i - first) * kDirectoryEntrySize);
        if (HRESULT hr = WriteFull(fd, offset, run.data(), run.size()); FAILED(hr))
            return hr;
        first = last;
    }
    return S_OK;
}

} // namespace ut::platform::posix
