#ifndef TAMBER_REF_H
#define TAMBER_REF_H

#include <atomic>
#include <cstddef>
#include <utility>

#include "tamber/Export.h"

namespace Tamber {

// Base of every reference-counted object of the layer. A new object starts with no reference;
// the first Ref that takes it raises the count to one, and the last Ref that lets go deletes it.
// XML nodes override AddRef/Release to count on the tree they belong to instead.
class TAMBER_API Object {
 public:
  Object() = default;
  Object(const Object&) = delete;
  Object& operator=(const Object&) = delete;

  // Counts one more reference; safe from any thread.
  virtual void AddRef() const;
  // Counts one reference less and deletes the object when none is left.
  virtual void Release() const;

 protected:
  virtual ~Object();

 private:
  mutable std::atomic<long> _refCount{0};
};

// A counted reference, like boost::intrusive_ptr: copying adds a reference, destruction and
// reset release one. A Ref to T converts to a Ref to any base of T, const included.
template <class T>
class Ref {
 public:
  Ref() noexcept : _p(nullptr) {}
  Ref(std::nullptr_t) noexcept : _p(nullptr) {}
  Ref(T* p) : _p(p) {
    if (_p) _p->AddRef();
  }
  Ref(const Ref& other) : Ref(other._p) {}
  Ref(Ref&& other) noexcept : _p(other._p) { other._p = nullptr; }
  template <class U>
  Ref(const Ref<U>& other) : Ref(other.get()) {}
  template <class U>
  Ref(Ref<U>&& other) noexcept : _p(other.detach()) {}
  ~Ref() {
    if (_p) _p->Release();
  }

  Ref& operator=(const Ref& other) {
    Ref(other).swap(*this);
    return *this;
  }
  Ref& operator=(Ref&& other) noexcept {
    Ref(std::move(other)).swap(*this);
    return *this;
  }
  Ref& operator=(T* p) {
    Ref(p).swap(*this);
    return *this;
  }

  void reset() { Ref().swap(*this); }
  void swap(Ref& other) noexcept { std::swap(_p, other._p); }

  T* get() const noexcept { return _p; }
  T* operator->() const noexcept { return _p; }
  T& operator*() const noexcept { return *_p; }
  explicit operator bool() const noexcept { return _p != nullptr; }

  // Gives up the reference without releasing it; the caller takes it over.
  T* detach() noexcept {
    T* p = _p;
    _p = nullptr;
    return p;
  }

 private:
  T* _p;
};

// Refs compare by the object they point to.
template <class T, class U>
bool operator==(const Ref<T>& a, const Ref<U>& b) {
  return a.get() == b.get();
}
template <class T, class U>
bool operator!=(const Ref<T>& a, const Ref<U>& b) {
  return a.get() != b.get();
}

}  // namespace Tamber

#endif
