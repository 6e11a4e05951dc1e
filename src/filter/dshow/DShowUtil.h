// Small helpers shared by the DirectShow side of the module: media-type copies, the module's object and
// lock counts, reference-counted pointers and the COM boundary. Windows only.
#pragma once

#include <windows.h>
#include <dshow.h>

#include <atomic>
#include <cstdint>
#include <new>

namespace ulvetta {
namespace dshow {

// Live COM objects of the module; DllCanUnloadNow answers from them and the server locks.
extern std::atomic<long> g_objectCount;

// Deep copy of a media type (the format block is duplicated with CoTaskMemAlloc).
HRESULT CopyMediaType(AM_MEDIA_TYPE* target, const AM_MEDIA_TYPE* source);
// Frees what a media type owns (format block and unknown) and clears it.
void FreeMediaType(AM_MEDIA_TYPE& mt);
// Frees a media type allocated with CoTaskMemAlloc together with what it owns.
void DeleteMediaType(AM_MEDIA_TYPE* mt);

// Runs the body of a COM method so that no exception crosses the interface: running out of memory
// gives E_OUTOFMEMORY, any other exception E_FAIL. Bodies leave their object consistent when they throw.
template <class Body>
HRESULT ComBoundary(Body&& body) noexcept {
    try {
        return body();
    } catch (const std::bad_alloc&) {
        return E_OUTOFMEMORY;
    } catch (...) {
        return E_FAIL;
    }
}

// Holds a critical section for its lifetime.
class CritSecLock {
public:
    explicit CritSecLock(CRITICAL_SECTION& cs) : cs_(cs) { EnterCriticalSection(&cs_); }
    ~CritSecLock() { LeaveCriticalSection(&cs_); }
    CritSecLock(const CritSecLock&) = delete;
    CritSecLock& operator=(const CritSecLock&) = delete;

private:
    CRITICAL_SECTION& cs_;
};

// A COM object with one interface I besides IUnknown and its own reference count; counted among the
// module's live objects. Starts with no reference; deleted by the last Release.
template <class I>
class SingleInterfaceObject : public I {
public:
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
        if (ppv == nullptr) return E_POINTER;
        if (riid == IID_IUnknown || riid == __uuidof(I)) {
            *ppv = static_cast<I*>(this);
            AddRef();
            return S_OK;
        }
        *ppv = nullptr;
        return E_NOINTERFACE;
    }
    STDMETHODIMP_(ULONG) AddRef() override { return ++refs_; }
    STDMETHODIMP_(ULONG) Release() override {
        const ULONG r = --refs_;
        if (r == 0) delete this;
        return r;
    }

protected:
    SingleInterfaceObject() { ++g_objectCount; }
    virtual ~SingleInterfaceObject() { --g_objectCount; }

private:
    std::atomic<ULONG> refs_{0};
};

// Holds one reference to a COM object.
template <class T>
class ComRef {
public:
    ComRef() = default;
    ComRef(T* p) : p_(p) {  // takes a new reference
        if (p_) p_->AddRef();
    }
    ComRef(const ComRef& o) : ComRef(o.p_) {}
    ComRef& operator=(const ComRef& o) {
        reset(o.p_);
        return *this;
    }
    ~ComRef() { reset(); }
    void reset(T* p = nullptr) {
        if (p) p->AddRef();
        T* old = p_;
        p_ = p;
        if (old) old->Release();
    }
    // Releases what is held and returns the slot for an out-parameter that already carries a reference.
    T** put() {
        reset();
        return &p_;
    }
    T* get() const { return p_; }
    T* operator->() const { return p_; }
    explicit operator bool() const { return p_ != nullptr; }

private:
    T* p_ = nullptr;
};

}  // namespace dshow
}  // namespace ulvetta
