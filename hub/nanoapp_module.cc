// SPDX-License-Identifier: Apache-2.0
#include "hub/nanoapp_module.h"

#include <dlfcn.h>

#include <cstdio>

#include "chre.h"

namespace qz::hub {
namespace {

std::string Hex(uint32_t value) {
  char text[16];
  std::snprintf(text, sizeof(text), "0x%08x", value);
  return text;
}

}  // namespace

std::string CheckNanoappInfo(const chreNslNanoappInfo& info) {
  if (info.magic != CHRE_NSL_NANOAPP_INFO_MAGIC) {
    return "magic is " + Hex(info.magic) + ", should be " + Hex(CHRE_NSL_NANOAPP_INFO_MAGIC);
  }
  // The same major version, and no newer minor one than this hub's own.
  if (info.targetApiVersion >> 24 != CHRE_API_VERSION_1_9 >> 24 ||
      (info.targetApiVersion >> 16) > (CHRE_API_VERSION_1_9 >> 16)) {
    return "target API version is " + Hex(info.targetApiVersion) +
           ", this hub runs 0x01000000 to " + Hex(CHRE_API_VERSION_1_9);
  }
  if (info.start == nullptr) return "start entry point is null";
  if (info.handleEvent == nullptr) return "event entry point is null";
  if (info.end == nullptr) return "end entry point is null";
  if (info.name == nullptr || info.vendor == nullptr) return "nanoapp or vendor name is null";
  if (info.structMinorVersion < CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION) {
    return "record version " + std::to_string(info.structMinorVersion) +
           " carries no permissions, should be " +
           std::to_string(CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION);
  }
  if (info.appPermissions != CHRE_PERMS_AUDIO) {
    return "permissions are " + Hex(info.appPermissions) + ", this hub grants exactly audio, " +
           Hex(CHRE_PERMS_AUDIO);
  }
  return {};
}

std::unique_ptr<NanoappModule> NanoappModule::Load(const std::string& path, LoadFailure* failure) {
  // With a slash, so that the loader takes the path as it is and does not search for the file.
  const std::string file = path.find('/') == std::string::npos ? "./" + path : path;
  void* handle = dlopen(file.c_str(), RTLD_NOW | RTLD_LOCAL);
  if (handle == nullptr) {
    *failure = {LoadFailure::Kind::kNotLoadable, dlerror()};
    return nullptr;
  }
  const auto* info =
      static_cast<const chreNslNanoappInfo*>(dlsym(handle, CHRE_NSL_NANOAPP_INFO_SYMBOL));
  if (info == nullptr) {
    *failure = {LoadFailure::Kind::kNotLoadable,
                path + ": no nanoapp: it does not export " CHRE_NSL_NANOAPP_INFO_SYMBOL};
    dlclose(handle);
    return nullptr;
  }
  const std::string error = CheckNanoappInfo(*info);
  if (!error.empty()) {
    *failure = {LoadFailure::Kind::kRefused, path + ": refused: " + error};
    dlclose(handle);
    return nullptr;
  }
  return std::unique_ptr<NanoappModule>(new NanoappModule(handle, info));
}

NanoappModule::~NanoappModule() { dlclose(handle_); }

}  // namespace qz::hub
