// Building blocks for framework objects: the reference-counting implementation shared by the
// module's and the host's objects, memory from a host allocator for objects built with a
// locator, and a smart pointer for interface references.
#pragma once

#include <atomic>
#include <cstdint>
#include <new>
#include <tuple>
#include <type_traits>
#include <utility>

#include "framework/uvo/interfaces.h"
#include "framework/uvo/result.h"

namespace uvo {

// Implements the three IObject slots for every interface in Interfaces. The first interface
// answers identifier 0. The count starts at 1: the creator owns the first reference.
template <class Derived, class... Interfaces>
class ObjectImpl : public Interfaces... {
  static_assert(sizeof...(Interfaces) > 0, "an object implements at least one interface");

 public:
  std::uint32_t AddRef() override { return refs_.fetch_add(1, std::memory_order_relaxed) + 1; }

  std::uint32_t Release() override {
    const std::uint32_t left = refs_.fetch_sub(1, std::memory_order_acq_rel) - 1;
    if (left == 0) Destroy();
    return left;
  }

  result_t QueryInterface(iid_t iid, void** out) override {
    if (out == nullptr) return kErrInvalidArgument;
    void* found = nullptr;
    if (iid == 0) {
      found = static_cast<First*>(static_cast<Derived*>(this));
    } else {
      ((found == nullptr && iid == Interfaces::kIid
            ? (found = static_cast<Interfaces*>(static_cast<Derived*>(this)), 0)
            : 0),
       ...);
    }
    *out = found;
    if (found == nullptr) return kErrNoInterface;
    AddRef();
    return kOk;
  }

  std::uint32_t RefCount() const { return refs_.load(std::memory_order_relaxed); }

  // Builds a Derived in memory taken from `allocator`; the object keeps one reference to
  // the allocator and gives the memory back to it when its count reaches 0.
  template <class... Args>
  static Derived* CreateWithAllocator(IAllocator* allocator, Args&&... args) {
    void* memory = allocator->Allocate(static_cast<std::uint32_t>(sizeof(Derived)));
    if (memory == nullptr) throw std::bad_alloc();
    Derived* object;
    try {
      object = ::new (memory) Derived(std::forward<Args>(args)...);
    } catch (...) {
      allocator->Free(memory);
      throw;
    }
    allocator->AddRef();
    object->memory_ = allocator;
    return object;
  }

 protected:
  ObjectImpl() = default;
  ObjectImpl(const ObjectImpl&) = delete;
  ObjectImpl& operator=(const ObjectImpl&) = delete;
  ~ObjectImpl() = default;

 private:
  using First = std::tuple_element_t<0, std::tuple<Interfaces...>>;

  void Destroy() {
    Derived* self = static_cast<Derived*>(this);
    IAllocator* memory = memory_;
    if (memory == nullptr) {
      delete self;
      return;
    }
    self->~Derived();
    memory->Free(self);
    memory->Release();
  }

  std::atomic<std::uint32_t> refs_{1};
  IAllocator* memory_ = nullptr;
};

// Owns one reference to a framework object.
template <class T>
class Ptr {
 public:
  Ptr() = default;
  Ptr(std::nullptr_t) {}
  // Takes over a reference the caller already owns.
  static Ptr Adopt(T* raw) {
    Ptr p;
    p.raw_ = raw;
    return p;
  }
  // Takes a new reference.
  static Ptr Share(T* raw) {
    if (raw) raw->AddRef();
    return Adopt(raw);
  }
  Ptr(const Ptr& other) : raw_(other.raw_) {
    if (raw_) raw_->AddRef();
  }
  Ptr(Ptr&& other) noexcept : raw_(std::exchange(other.raw_, nullptr)) {}
  Ptr& operator=(Ptr other) noexcept {
    std::swap(raw_, other.raw_);
    return *this;
  }
  ~Ptr() { Reset(); }

  void Reset() {
    if (T* old = std::exchange(raw_, nullptr)) old->Release();
  }
  T* Get() const { return raw_; }
  T* operator->() const { return raw_; }
  explicit operator bool() const { return raw_ != nullptr; }
  // For out-parameters: releases what is held and exposes the slot.
  T** Receive() {
    Reset();
    return &raw_;
  }
  void** ReceiveVoid() { return reinterpret_cast<void**>(Receive()); }
  T* Detach() { return std::exchange(raw_, nullptr); }

 private:
  T* raw_ = nullptr;
};

}  // namespace uvo
