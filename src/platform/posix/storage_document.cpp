// The POSIX compound-file document: reading the tree through libgsf, keeping the changed
// streams' bytes, and committing the tree as a new file that replaces the old one at once.
#include "posix/storage_document.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <unistd.h>

#include <ut/platform/detail/boundary.h>

#include "posix/descriptor.h"
#include "posix/lockbytes.h"
#include "posix/path.h"

namespace ut::platform::posix {
namespace {

constexpr std::size_t kCopyChunk = 1 << 20;

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
        node.chain.reset(); // its sectors are the file's now
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
        node->chain.reset();
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
    if (stream.Changed())
        return S_OK;
    return ut::ExportBoundary([&] {
        if (stream.size < kMiniStreamCutoff) {
            auto bytes = std::make_unique<std::vector<std::uint8_t>>();
            bytes->reserve(stream.size);
            if (HRESULT hr = ReadAll(stream,
                                     [&](const std::uint8_t* data, std::size_t count) {
                                         bytes->insert(bytes->end(), data, data + count);
                                         return S_OK;
                                     });
                FAILED(hr))
                return hr;
            stream.bytes = std::move(bytes);
            return S_OK;
        }
        return Spill(stream);
    });
}

HRESULT Document::ReadAll(Node& stream, const ByteSink& sink) {
    if (stream.bytes)
        return stream.bytes->empty() ? S_OK : sink(stream.bytes->data(), stream.bytes->size());
    if (stream.size == 0)
        return S_OK;
    GsfOwner<GsfInput> source;
    if (!stream.chain) {
        if (HRESULT hr = CheckSource(stream); FAILED(hr))
            return hr;
        source = OpenSource(stream);
        if (!source)
            return STG_E_DOCFILECORRUPT;
    }
    std::vector<std::uint8_t> chunk(std::min<ULONGLONG>(stream.size, kCopyChunk));
    for (ULONGLONG at = 0; at < stream.size;) {
        std::size_t count = std::min<ULONGLONG>(chunk.size(), stream.size - at);
        HRESULT hr = source ? GsfReadAt(source.get(), at, chunk.data(), count)
                            : stream.chain->Read(at, chunk.data(), count);
        if (FAILED(hr) || FAILED(hr = sink(chunk.data(), count)))
            return hr;
        at += count;
    }
    return S_OK;
}

HRESULT Document::ReadChanged(Node& stream, ULONGLONG at, void* buffer, std::size_t count) {
    if (stream.chain)
        return stream.chain->Read(at, buffer, count);
    std::memcpy(buffer, stream.bytes->data() + at, count);
    return S_OK;
}

// Writes over what is at `at` and appends the rest, with zeros for a gap before it: appended
// bytes are copied once, never cleared first.
HRESULT Document::WriteChanged(Node& stream, ULONGLONG at, const std::uint8_t* data, std::size_t count) {
    return ut::ExportBoundary(
        [&] {
            if (!stream.chain && at + count >= kMiniStreamCutoff)
                if (HRESULT hr = Spill(stream); FAILED(hr))
                    return hr;
            dirty_ = true;
            if (stream.chain) {
                HRESULT hr = stream.chain->Write(at, data, count);
                stream.size = stream.chain->Size();
                return hr;
            }
            std::vector<std::uint8_t>& bytes = *stream.bytes;
            if (at > bytes.size())
                bytes.resize(at);
            std::size_t over = std::min<std::size_t>(count, bytes.size() - at);
            if (over)
                std::memcpy(bytes.data() + at, data, over);
            bytes.insert(bytes.end(), data + over, data + count);
            stream.size = bytes.size();
            return S_OK;
        },
        HRESULT{STG_E_INSUFFICIENTMEMORY});
}

HRESULT Document::ResizeChanged(Node& stream, ULONGLONG size) {
    return ut::ExportBoundary(
        [&] {
            if (!stream.chain && size >= kMiniStreamCutoff)
                if (HRESULT hr = Spill(stream); FAILED(hr))
                    return hr;
            dirty_ = true;
            if (stream.chain) {
                HRESULT hr = stream.chain->Resize(size);
                stream.size = stream.chain->Size();
                return hr;
            }
            stream.bytes->resize(size);
            stream.size = size;
            return S_OK;
        },
        HRESULT{STG_E_INSUFFICIENTMEMORY});
}

void Document::Settle(Node& stream) {
    if (stream.chain)
        (void)stream.chain->Release(); // what fails to go now stays gathered, and the commit tells
}

// A stream that reaches the mini-stream cutoff moves its bytes, from memory or from the file,
// to the sectors of the next file.
HRESULT Document::Spill(Node& stream) {
    std::shared_ptr<SectorFile> image;
    if (HRESULT hr = Image(image); FAILED(hr))
        return hr;
    auto chain = std::make_unique<SectorChain>(image);
    if (HRESULT hr =
            ReadAll(stream, [&](const std::uint8_t* data,
                                std::size_t count) { return chain->Write(chain->Size(), data, count); });
        FAILED(hr))
        return hr;
    stream.chain = std::move(chain);
    stream.bytes.reset();
    return S_OK;
}

// Beside the document's file when it is one, so that the commit renames it into place;
// elsewhere a nameless temporary file that the commit copies into the byte array.
HRESULT Document::Image(std::shared_ptr<SectorFile>& image) {
    if (!image_) {
        FileBytes* file = FileBehind(bytes_.Get());
        int fd = -1;
        if (HRESULT hr = file ? file->BeginReplacement(fd) : CreateScratchFile(fd); FAILED(hr))
            return hr;
        try {
            image_ = std::make_shared<SectorFile>(fd, file == nullptr);
        } catch (...) {
            if (!file)
                ::close(fd);
            throw;
        }
    }
    image = image_;
    return S_OK;
}

void Document::DropImage() {
    if (!image_)
        return;
    image_->Retire();
    image_.reset();
    if (FileBytes* file = FileBehind(bytes_.Get()))
        file->AbandonReplacement();
}

HRESULT Document::Commit(bool durable) {
    if (closed_)
        return STG_E_REVERTED;
    if (!Writable())
        return STG_E_ACCESSDENIED;
    return ut::ExportBoundary([&] {
        std::shared_ptr<SectorFile> image;
        if (HRESULT hr = Image(image); FAILED(hr))
            return hr;
        std::uint32_t mark = image->Count();
        HRESULT hr = WriteCompoundFile(
            *image, *root_, [this](Node& stream, const ByteSink& sink) { return ReadAll(stream, sink); });
        if (SUCCEEDED(hr)) {
            FileBytes* file = FileBehind(bytes_.Get());
            hr = file ? file->FinishReplacement(durable) : CopyImageToBytes(*image, durable);
        }
        if (FAILED(hr)) {
            image->Truncate(mark); // the streams' sectors stay for the next try
            return hr;
        }
        DropImage(); // the file it was is the document's file now, or was copied into it
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
        DropImage();
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
    DropImage();
    reader_.reset();
    layout_.reset();
    bytes_.Reset();
}

HRESULT Document::CopyImageToBytes(const SectorFile& image, bool durable) {
    ULONGLONG size = SectorFile::Offset(image.Count());
    std::vector<std::uint8_t> chunk(std::min<ULONGLONG>(kCopyChunk, size));
    for (ULONGLONG at = 0; at < size;) {
        std::size_t count = std::min<ULONGLONG>(chunk.size(), size - at);
        if (HRESULT hr = image.Read(at, chunk.data(), count); FAILED(hr))
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
    total.QuadPart = size;
    if (HRESULT hr = bytes_->SetSize(total); FAILED(hr))
        return hr;
    return durable ? bytes_->Flush() : S_OK;
}

} // namespace ut::platform::posix
