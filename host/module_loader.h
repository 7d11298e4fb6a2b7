// Loads libpelmix.so with dlopen and resolves its two exports.
#pragma once

#include <string>

#include "framework/uvo/interfaces.h"

namespace pelmix::host {

class Module {
 public:
  // Throws std::runtime_error with dlerror's text when the module or an export is missing.
  explicit Module(const std::string& path);
  ~Module();
  Module(const Module&) = delete;
  Module& operator=(const Module&) = delete;

  uvo::result_t GetObjectFactory(uvo::IServiceLocator* locator, std::uint32_t clsid,
                                 uvo::IObjectFactory** out) const {
    return getObjectFactory_(locator, clsid, out);
  }
  uvo::result_t CanUnload() const { return canUnload_(); }
  const std::string& Path() const { return path_; }

 private:
  std::string path_;
  void* handle_ = nullptr;
  uvo::GetObjectFactoryFn getObjectFactory_ = nullptr;
  uvo::CanUnloadModuleFn canUnload_ = nullptr;
};

}  // namespace pelmix::host
