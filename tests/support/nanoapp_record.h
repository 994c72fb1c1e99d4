// SPDX-License-Identifier: Apache-2.0
// The record of a nanoapp that a hub runs.
#pragma once

#include "chre.h"
#include "chre_nanoapp_info.h"

namespace qz::test {

constexpr chreNslNanoappInfo NanoappRecord(decltype(chreNslNanoappInfo::start) start,
                                           decltype(chreNslNanoappInfo::handleEvent) handle_event,
                                           decltype(chreNslNanoappInfo::end) end,
                                           uint32_t magic = CHRE_NSL_NANOAPP_INFO_MAGIC) {
  chreNslNanoappInfo info = {};
  info.magic = magic;
  info.structMinorVersion = CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION;
  info.targetApiVersion = CHRE_API_VERSION_1_9;
  info.vendor = info.name = "tests";
  info.start = start;
  info.handleEvent = handle_event;
  info.end = end;
  info.appPermissions = CHRE_PERMS_AUDIO;
  return info;
}

}  // namespace qz::test
