// The framework's 8-bit string: how a text the module produces (a verdict's target) crosses
// the host boundary. The bytes live in memory from a host allocator; the string holds one
// reference to that allocator and gives the memory back to it, so the side that frees the
// bytes never needs to know which side allocated them.
//
// Layout (for hosts not written in C++): { char* data; uint32 length; IAllocator* allocator; }.
// `data` is null while the string has never been assigned; otherwise it holds `length` bytes
// and a terminating zero. To free: allocator->Free(data), then allocator->Release().
#pragma once

#include <cstdint>
#include <cstring>
#include <limits>
#include <new>
#include <string_view>
#include <utility>

#include "framework/uvo/interfaces.h"

namespace uvo {

class String8 {
 public:
  String8() = default;
  String8(const String8& other) {
    if (other.data_ != nullptr) Assign(other.allocator_, other.view());
  }
  String8(String8&& other) noexcept
      : data_(std::exchange(other.data_, nullptr)),
        length_(std::exchange(other.length_, 0)),
        allocator_(std::exchange(other.allocator_, nullptr)) {}
  String8& operator=(const String8& other) {
    if (this != &other) {
      if (other.data_ == nullptr) {
        Clear();
      } else {
        Assign(other.allocator_, other.view());
      }
    }
    return *this;
  }
  String8& operator=(String8&& other) noexcept {
    if (this != &other) {
      Clear();
      data_ = std::exchange(other.data_, nullptr);
      length_ = std::exchange(other.length_, 0);
      allocator_ = std::exchange(other.allocator_, nullptr);
    }
    return *this;
  }
  ~String8() { Clear(); }

  // Replaces the bytes with a copy of `bytes` in memory from `allocator`. Raises
  // std::bad_alloc when the allocator refuses (or the text does not fit 32 bits); the string
  // is then left as it was.
  void Assign(IAllocator* allocator, std::string_view bytes) {
    if (allocator == nullptr || bytes.size() >= std::numeric_limits<std::uint32_t>::max()) {
      throw std::bad_alloc();
    }
    const auto size = static_cast<std::uint32_t>(bytes.size());
    auto* memory = static_cast<char*>(allocator->Allocate(size + 1));
    if (memory == nullptr) throw std::bad_alloc();
    if (size != 0) std::memcpy(memory, bytes.data(), size);
    memory[size] = '\0';
    allocator->AddRef();
    Clear();
    data_ = memory;
    length_ = size;
    allocator_ = allocator;
  }

  // Frees the bytes; the string is then empty and unassigned.
  void Clear() noexcept {
    if (data_ != nullptr) allocator_->Free(data_);
    if (allocator_ != nullptr) allocator_->Release();
    data_ = nullptr;
    length_ = 0;
    allocator_ = nullptr;
  }

  std::string_view view() const { return {data_ != nullptr ? data_ : "", length_}; }
  // Never null: "" while unassigned.
  const char* c_str() const { return data_ != nullptr ? data_ : ""; }
  std::uint32_t size() const { return length_; }
  bool empty() const { return length_ == 0; }

 private:
  char* data_ = nullptr;
  std::uint32_t length_ = 0;
  IAllocator* allocator_ = nullptr;
};

}  // namespace uvo
