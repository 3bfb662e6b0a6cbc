// libgsf's reader over our byte arrays: a GsfInput subclass that reads an ILockBytes through a
// small read-ahead window (libgsf reads its tables one sector at a time).
#include "posix/gsf_io.h"

#include <algorithm>
#include <cstring>
#include <gsf/gsf-infile-msole.h>
#include <gsf/gsf-input-impl.h>
#include <mutex>

namespace ut::platform::posix {
namespace {

constexpr std::size_t kWindowSize = 64 * 1024;

struct LockBytesInput {
    GsfInput input;
    ILockBytes* bytes;
    // The read-ahead window: bytes [windowStart, windowStart + windowLength) of the array.
    guint8* window;
    ULONGLONG windowStart;
    std::size_t windowLength;
    // Where a read without a caller's buffer lands.
    guint8* scratch;
    std::size_t scratchSize;
};

struct LockBytesInputClass {
    GsfInputClass inputClass;
};

GObjectClass* parentClass = nullptr;

LockBytesInput* AsLockBytesInput(GsfInput* input) {
    return reinterpret_cast<LockBytesInput*>(input);
}

HRESULT ReadFully(ILockBytes* bytes, ULONGLONG offset, guint8* buffer, std::size_t count, std::size_t& done) {
    done = 0;
    while (done < count) {
        ULARGE_INTEGER at{};
        at.QuadPart = offset + done;
        ULONG want = static_cast<ULONG>(std::min<std::size_t>(count - done, 1u << 30));
        ULONG got = 0;
        if (HRESULT hr = bytes->ReadAt(at, buffer + done, want, &got); FAILED(hr))
            return hr;
        if (got == 0)
            break;
        done += got;
    }
    return S_OK;
}

// Copies [offset, offset + count) into `target`, through the window for small reads.
bool ReadInto(LockBytesInput* self, ULONGLONG offset, guint8* target, std::size_t count) {
    std::size_t done = 0;
    if (count >= kWindowSize)
        return SUCCEEDED(ReadFully(self->bytes, offset, target, count, done)) && done == count;
    bool inWindow = offset >= self->windowStart && offset + count <= self->windowStart + self->windowLength;
    if (!inWindow) {
        if (!self->window)
            self->window = static_cast<guint8*>(g_malloc(kWindowSize));
        self->windowStart = offset;
        if (FAILED(ReadFully(self->bytes, offset, self->window, kWindowSize, self->windowLength)) ||
            self->windowLength < count) {
            self->windowLength = 0;
            return false;
        }
    }
    std::memcpy(target, self->window + (offset - self->windowStart), count);
    return true;
}

const guint8* Read(GsfInput* input, size_t count, guint8* buffer) {
    LockBytesInput* self = AsLockBytesInput(input);
    if (!buffer) {
        if (self->scratchSize < count) {
            self->scratch = static_cast<guint8*>(g_realloc(self->scratch, count));
            self->scratchSize = count;
        }
        buffer = self->scratch;
    }
    return ReadInto(self, static_cast<ULONGLONG>(input->cur_offset), buffer, count) ? buffer : nullptr;
}

// Positions are the base class's; there is nothing to move here. FALSE means success.
gboolean Seek(GsfInput*, gsf_off_t, GSeekType) {
    return FALSE;
}

GsfInput* NewInput(ILockBytes* bytes, gsf_off_t size);

GsfInput* Dup(GsfInput* input, GError**) {
    return NewInput(AsLockBytesInput(input)->bytes, input->size);
}

void Finalize(GObject* object) {
    LockBytesInput* self = reinterpret_cast<LockBytesInput*>(object);
    if (self->bytes)
        self->bytes->Release();
    g_free(self->window);
    g_free(self->scratch);
    parentClass->finalize(object);
}

void ClassInit(gpointer klass, gpointer) {
    parentClass = static_cast<GObjectClass*>(g_type_class_peek_parent(klass));
    static_cast<GObjectClass*>(klass)->finalize = Finalize;
    auto* inputClass = static_cast<GsfInputClass*>(klass);
    inputClass->Dup = Dup;
    inputClass->Read = Read;
    inputClass->Seek = Seek;
}

GType LockBytesInputType() {
    static GType type = [] {
        GTypeInfo info{};
        info.class_size = sizeof(LockBytesInputClass);
        info.class_init = ClassInit;
        info.instance_size = sizeof(LockBytesInput);
        return g_type_register_static(GSF_INPUT_TYPE, "UtLockBytesInput", &info, static_cast<GTypeFlags>(0));
    }();
    return type;
}

GsfInput* NewInput(ILockBytes* bytes, gsf_off_t size) {
    auto* self = static_cast<LockBytesInput*>(g_object_new(LockBytesInputType(), nullptr));
    self->bytes = bytes;
    bytes->AddRef();
    gsf_input_set_size(&self->input, size);
    return &self->input;
}

void Discard(const gchar*, GLogLevelFlags, const gchar*, gpointer) {}

// libgsf reports what it finds odd on standard error; the storage reports through its results.
void SilenceLibgsf() {
    static std::once_flag once;
    std::call_once(once, [] {
        constexpr auto kAllLevels =
            static_cast<GLogLevelFlags>(G_LOG_LEVEL_MASK | G_LOG_FLAG_FATAL | G_LOG_FLAG_RECURSION);
        for (const char* domain : {"libgsf", "libgsf:msole", "GLib-GObject"})
            g_log_set_handler(domain, kAllLevels, Discard, nullptr);
    });
}

} // namespace

HRESULT OpenGsfReader(ILockBytes* bytes, ULONGLONG size, GsfOwner<GsfInfile>& reader) {
    SilenceLibgsf();
    GsfOwner<GsfInput> input(NewInput(bytes, static_cast<gsf_off_t>(size)));
    GError* error = nullptr;
    reader.reset(gsf_infile_msole_new(input.get(), &error));
    if (error)
        g_error_free(error);
    return reader ? S_OK : STG_E_DOCFILECORRUPT;
}

GsfOwner<GsfInput> GsfChild(GsfInfile* storage, const std::string& name) {
    return GsfOwner<GsfInput>(gsf_infile_child_by_name(storage, name.c_str()));
}

HRESULT GsfReadAt(GsfInput* input, ULONGLONG offset, void* buffer, std::size_t count) {
    if (count == 0)
        return S_OK;
    if (gsf_input_seek(input, static_cast<gsf_off_t>(offset), G_SEEK_SET))
        return STG_E_SEEKERROR;
    return gsf_input_read(input, count, static_cast<guint8*>(buffer)) ? S_OK : STG_E_DOCFILECORRUPT;
}

} // namespace ut::platform::posix
