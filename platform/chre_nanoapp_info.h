// SPDX-License-Identifier: Apache-2.0
// The record by which a runtime's loader recognises a nanoapp: read from the module's exported
// symbol
// `_chreNslDsoNanoappInfo`. Little-endian; 56 bytes where pointers have 32 bits.
#ifndef QZ_PLATFORM_CHRE_NANOAPP_INFO_H_
#define QZ_PLATFORM_CHRE_NANOAPP_INFO_H_

#include <stdbool.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

#define CHRE_NSL_NANOAPP_INFO_MAGIC UINT32_C(0x50e69977)
#define CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION UINT8_C(3)
#define CHRE_NSL_NANOAPP_INFO_SYMBOL "_chreNslDsoNanoappInfo"

// Bits of `appPermissions`.
#define CHRE_PERMS_NONE UINT32_C(0)
#define CHRE_PERMS_AUDIO UINT32_C(1)

struct chreNslNanoappInfo {
  uint32_t magic;
  uint8_t structMinorVersion;
  uint8_t isSystemNanoapp : 1;
  uint8_t isTcmNanoapp : 1;
  uint8_t reservedFlags : 6;
  uint8_t reserved;
  uint32_t targetApiVersion;  // major.minor.patch as 0xMMmmpppp
  const char* vendor;
  const char* name;
  uint64_t appId;
  uint32_t appVersion;
  bool (*start)(void);
  void (*handleEvent)(uint32_t senderInstanceId, uint16_t eventType, const void* eventData);
  void (*end)(void);
  const char* appVersionString;  // in the section .unstable_id
  uint32_t appPermissions;
};

#ifdef __cplusplus
}
#endif

#endif  // QZ_PLATFORM_CHRE_NANOAPP_INFO_H_
