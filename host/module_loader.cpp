#include "host/module_loader.h"

#include <dlfcn.h>

#include <stdexcept>

namespace pelmix::host {
namespace {

std::string LastDlError(const std::string& fallback) {
  const char* text = ::dlerror();
  return text ? text : fallback;
}

}  // namespace

Module::Module(const std::string& path) : path_(path) {
  handle_ = ::dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle_ == nullptr) throw std::runtime_error(LastDlError("cannot load " + path));
  getObjectFactory_ =
      reinterpret_cast<uvo::GetObjectFactoryFn>(::dlsym(handle_, "uvoGetObjectFactory"));
  canUnload_ = reinterpret_cast<uvo::CanUnloadModuleFn>(::dlsym(handle_, "uvoCanUnloadModule"));
  if (getObjectFactory_ == nullptr || canUnload_ == nullptr) {
    const std::string error = LastDlError(path + ": missing uvo export");
    ::dlclose(handle_);
    throw std::runtime_error(error);
  }
}

Module::~Module() {
  // Unload only when the module says no object of it is alive.
  if (handle_ != nullptr && canUnload_() == 0) ::dlclose(handle_);
}

}  // namespace pelmix::host
