// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>

#include "chre_nanoapp_info.h"

namespace qz::hub {

// Why a module is not running.
struct LoadFailure {
  enum class Kind {
    kNotLoadable,  // no such file, not a module, or without a record
    kRefused,      // its record is not one that this hub runs
  };
  Kind kind = Kind::kNotLoadable;
  std::string message;  // names the file, the value found and what was expected
};

// Empty when the hub runs modules with this record, else a message that names the first invalid
// field.
std::string CheckNanoappInfo(const chreNslNanoappInfo& info);

// A module, loaded by the dynamic loader and accepted by its record; unloaded with the object.
class NanoappModule {
 public:
  // Null with `*failure` (not null) filled when the module can't be loaded or is refused.
  static std::unique_ptr<NanoappModule> Load(const std::string& path, LoadFailure* failure);

  NanoappModule(const NanoappModule&) = delete;
  NanoappModule& operator=(const NanoappModule&) = delete;
  ~NanoappModule();

  const chreNslNanoappInfo& info() const { return *info_; }

 private:
  NanoappModule(void* handle, const chreNslNanoappInfo* info) : handle_(handle), info_(info) {}

  void* handle_;
  const chreNslNanoappInfo* info_;
};

}  // namespace qz::hub
