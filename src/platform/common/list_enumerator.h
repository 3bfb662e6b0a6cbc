// The system's enumerators (IEnumSTATSTG, IEnumFORMATETC) over a list taken when the
// enumerator was made, on both homes. `Derived` says how an item is handed out (CopyOut, which
// fails when memory runs out) and taken back (Discard), and what a null array answers.
#pragma once

#include <algorithm>
#include <memory>
#include <new>
#include <vector>

#include "common/object.h"

namespace ut::platform {

template <class Derived, class Interface, class Item>
class ListEnumerator : public Object<Interface> {
public:
    using Items = std::vector<Item>;

    ListEnumerator(std::shared_ptr<const Items> items, ULONG next) : items_(std::move(items)), next_(next) {}

    HRESULT STDMETHODCALLTYPE Next(ULONG count, Item* out, ULONG* fetched) override {
        if (fetched)
            *fetched = 0;
        if (!out)
            return Derived::kNullArray;
        if (count > 1 && !fetched)
            return E_INVALIDARG;
        ULONG done = 0;
        for (; done < count && next_ < items_->size(); ++done, ++next_) {
            if (!Derived::CopyOut((*items_)[next_], out[done])) {
                for (ULONG i = 0; i < done; ++i)
                    Derived::Discard(out[i]);
                return E_OUTOFMEMORY;
            }
        }
        if (fetched)
            *fetched = done;
        return done == count ? S_OK : S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Skip(ULONG count) override {
        ULONG left = static_cast<ULONG>(items_->size()) - next_;
        next_ += std::min(count, left);
        return count <= left ? S_OK : S_FALSE;
    }

    HRESULT STDMETHODCALLTYPE Reset() override {
        next_ = 0;
        return S_OK;
    }

    HRESULT STDMETHODCALLTYPE Clone(Interface** clone) override {
        if (!clone)
            return Derived::kNullArray;
        *clone = new (std::nothrow) Derived(items_, next_);
        return *clone ? S_OK : E_OUTOFMEMORY;
    }

protected:
    ~ListEnumerator() override = default;

private:
    std::shared_ptr<const Items> items_;
    ULONG next_;
};

} // namespace ut::platform
