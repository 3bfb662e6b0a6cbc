// One open compound file on POSIX: its elements as a tree in memory (unchanged streams stay in
// the file and are read through libgsf), and the commit that writes the whole tree back.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <ut/platform/storage.h>

#include "posix/compound_file.h"
#include "posix/compound_writer.h"
#include "posix/gsf_io.h"

namespace ut::platform::posix {

class Document;

// A storage or a stream of the document.
struct Node {
    std::wstring name;
    NameKey key; // of the name, kept with it
    DWORD type = STGTY_STREAM;
    CLSID clsid{};
    DWORD stateBits = 0;
    FILETIME created{};
    FILETIME modified{};
    Node* parent = nullptr;
    // A storage's elements, kept in name order (NameLess).
    std::vector<std::shared_ptr<Node>> children;

    // Where the element is in the file: its entry once the file is read, and the name it has
    // there (for libgsf, and for finding the entry).
    std::uint32_t entry = kNoEntry;
    std::string sourceName;
    NameKey sourceKey;
    bool inFile = false;
    // A storage's reader, opened when one of its elements is first read.
    GsfOwner<GsfInfile> reader;

    // A stream's bytes once changed here: in memory while it is shorter than the mini-stream
    // cutoff, then in the sectors of the file the next commit writes. Until then they are read
    // from the file.
    std::unique_ptr<std::vector<std::uint8_t>> bytes;
    std::unique_ptr<SectorChain> chain;
    ULONGLONG size = 0;

    // How many interfaces hold the element; elements open once at a time.
    int holders = 0;
    // Destroyed or reverted: the interfaces that hold it answer STG_E_REVERTED.
    bool gone = false;

    bool IsStorage() const { return type == STGTY_STORAGE; }
    bool Changed() const { return bytes || chain; }
    std::shared_ptr<Node> Find(const std::wstring& name) const { return Find(KeyOf(name)); }
    std::shared_ptr<Node> Find(const NameKey& key) const;
    // Names the node; its place among its siblings is the caller's to keep.
    void Name(std::wstring text) {
        key = KeyOf(text);
        name = std::move(text);
    }
    // Adds an element where its name belongs; none of that name may be there.
    void Insert(std::shared_ptr<Node> child);
    void Remove(const Node* child);
};

// Whether a name can name an element: 1 to 31 characters, none of \ / : !.
bool ValidElementName(const wchar_t* name);

class Document {
public:
    // Reads the compound file in `bytes`. `mode` is the root's open mode; `name` what its Stat
    // reports.
    static HRESULT Open(ILockBytes* bytes, DWORD mode, std::wstring name, SNB exclude,
                        std::shared_ptr<Document>& document);
    // Starts an empty compound file in `bytes` and writes it at once.
    static HRESULT Create(ILockBytes* bytes, DWORD mode, std::wstring name,
                          std::shared_ptr<Document>& document);

    Node& Root() { return *root_; }
    std::shared_ptr<Node> RootNode() const { return root_; }
    const std::wstring& Name() const { return name_; }
    DWORD Mode() const { return mode_; }
    bool Writable() const { return (mode_ & 3) != STGM_READ; }
    bool Closed() const { return closed_; }
    // Changes since the reader was opened make cached libgsf inputs stale.
    std::uint64_t Generation() const { return generation_; }
    void Touch() { dirty_ = true; }

    // Writes the whole tree into the file, atomically where the bytes are a file of ours, and
    // durably unless asked not to.
    HRESULT Commit(bool durable = true);
    // Forgets the changes since the last commit; the elements open until now are reverted.
    HRESULT Revert();
    // The root's last release: a direct-mode document writes its changes first.
    void Close();

    // Checks that a stream's bytes in the file are whole before they are read.
    HRESULT CheckSource(const Node& stream);
    // libgsf's input for a stream's bytes in the file, or null.
    GsfOwner<GsfInput> OpenSource(Node& stream);
    // Copies a stream's bytes from the file to where they can be changed.
    HRESULT Materialize(Node& stream);
    // Reads, writes or resizes a changed stream's bytes; a read stays within its size.
    HRESULT ReadChanged(Node& stream, ULONGLONG at, void* buffer, std::size_t count);
    HRESULT WriteChanged(Node& stream, ULONGLONG at, const std::uint8_t* data, std::size_t count);
    HRESULT ResizeChanged(Node& stream, ULONGLONG size);
    // Hands all of a stream's bytes, in order, to `sink`, from wherever they are.
    HRESULT ReadAll(Node& stream, const ByteSink& sink);
    // No interface holds the stream any more: what it gathered in memory goes to the file.
    void Settle(Node& stream);
    // Empties the elements of `storage` named in `names`, as if they had been opened empty.
    void Exclude(Node& storage, SNB names);

private:
    Document(ILockBytes* bytes, DWORD mode, std::wstring name);

    HRESULT Load();
    HRESULT EnsureLoaded();
    void Adopt(Node& node, std::uint32_t entry);
    void BuildChildren(Node& storage);
    void Rebase(Node& node);
    void Locate(Node& node, std::uint32_t entry);
    GsfInfile* ReaderOf(Node& storage);
    HRESULT Spill(Node& stream);
    HRESULT Image(std::shared_ptr<SectorFile>& image);
    HRESULT CopyImageToBytes(const SectorFile& image, bool durable);
    void DropImage();

    ComPtr<ILockBytes> bytes_;
    DWORD mode_;
    std::wstring name_;
    std::unique_ptr<CompoundFile> layout_;
    GsfOwner<GsfInfile> reader_;
    std::shared_ptr<Node> root_;
    // The file the next commit writes, once a stream's bytes or the commit needs it.
    std::shared_ptr<SectorFile> image_;
    std::uint64_t generation_ = 0;
    bool dirty_ = false;
    bool closed_ = false;
};

// Marks a node and everything below it as gone.
void MarkGone(Node& node);

} // namespace ut::platform::posix
