// The uvo component contract as the module and its hosts see it: abstract classes whose
// virtual functions sit in the documented slot order, 32-bit interface identifiers and
// signed 32-bit result codes. A host written in C can call the same vtables.
#pragma once

#include <cstdint>

namespace uvo {

using result_t = std::int32_t;
using iid_t = std::uint32_t;

// Slots 0..2 of every framework object.
class IObject {
 public:
  static constexpr iid_t kIid = 0;
  virtual std::uint32_t AddRef() = 0;   // returns the new count
  virtual std::uint32_t Release() = 0;  // returns the new count
  virtual result_t QueryInterface(iid_t iid, void** out) = 0;

 protected:
  ~IObject() = default;
};

class IServiceLocator;

class IObjectFactory : public IObject {
 public:
  static constexpr iid_t kIid = 0x80077A33;
  virtual result_t CreateInstance(IServiceLocator* locator, iid_t iid, void** out) = 0;

 protected:
  ~IObjectFactory() = default;
};

class IServiceLocator : public IObject {
 public:
  static constexpr iid_t kIid = 0x84B5BC07;
  // param is reserved and always 0.
  virtual result_t GetService(iid_t iid, std::uint32_t param, void** out) = 0;

 protected:
  ~IServiceLocator() = default;
};

class IAllocator : public IObject {
 public:
  static constexpr iid_t kIid = 0x9CCA5603;
  virtual void* Allocate(std::uint32_t size) = 0;  // slot 3; null on failure
  virtual void* Reallocate(void* pointer,
                           std::uint32_t size) = 0;  // slot 4; not used by the module
  virtual void Free(void* pointer) = 0;              // slot 5

 protected:
  ~IAllocator() = default;
};

class ITracer : public IObject {
 public:
  static constexpr iid_t kIid = 0x6EF3329B;
  // Level 1000 asks the tracer to regrow the record *buffer to `size` bytes, keeping its text.
  static constexpr int kRegrowLevel = 1000;
  virtual result_t CreateRecord(int level, char** buffer, std::uint32_t size) = 0;  // slot 3
  virtual result_t CommitRecord(char* buffer, std::uint32_t length) = 0;            // slot 4

 protected:
  ~ITracer() = default;
};

// Asked of a tracer through QueryInterface. Only slot 6 is used by the module; slots 3..5 are
// the host's own.
class ITraceLevelSource : public IObject {
 public:
  static constexpr iid_t kIid = 0xFA0CE748;
  virtual result_t SetTraceLevel(int level) = 0;                 // slot 3
  virtual result_t Flush() = 0;                                  // slot 4
  virtual result_t GetCommittedCount(std::uint64_t* count) = 0;  // slot 5
  virtual result_t GetTraceLevel(int* level) = 0;                // slot 6

 protected:
  ~ITraceLevelSource() = default;
};

// A host file (the knowledge base handed to the service) or a host stream (a mail part).
// Both offer the same slots. The identifier is the reference host's own choice: the module
// never asks for it.
class IStream : public IObject {
 public:
  static constexpr iid_t kIid = 0x2C5E9B41;
  enum SeekOrigin : std::uint32_t { kFromStart = 0, kFromCurrent = 1, kFromEnd = 2 };
  virtual result_t Read(void* buffer, std::uint32_t count, std::uint32_t* read) = 0;  // slot 3
  virtual result_t Write(const void* buffer, std::uint32_t count,
                         std::uint32_t* written) = 0;  // slot 4, not used by the module
  virtual result_t Seek(std::uint32_t origin, std::int64_t offset,
                        std::uint64_t* position) = 0;  // slot 5
  virtual result_t Tell(std::uint64_t* position) = 0;  // slot 6
  virtual result_t GetSize(std::uint64_t* size) = 0;   // slot 7

 protected:
  ~IStream() = default;
};

// Exported by the module with C linkage.
using GetObjectFactoryFn = result_t (*)(IServiceLocator* locator, std::uint32_t clsid,
                                        IObjectFactory** out);
using CanUnloadModuleFn = result_t (*)();

}  // namespace uvo
