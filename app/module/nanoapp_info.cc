// SPDX-License-Identifier: Apache-2.0
// What a loader sees of the module: the record and the string that name it, its only exports.

#include "app/nanoapp.h"
#include "chre.h"
#include "chre_nanoapp_info.h"

#define QZ_EXPORT __attribute__((visibility("default")))

extern "C" {

QZ_EXPORT extern const char _chreNanoappUnstableId[];
QZ_EXPORT extern const chreNslNanoappInfo _chreNslDsoNanoappInfo;

// Which build this is, for people and tools: QZ_BUILD_NUMBER and QZ_DEVICE come from the build.
__attribute__((section(".unstable_id"))) const char _chreNanoappUnstableId[] =
    "nanoapp=qz@" QZ_BUILD_NUMBER "~" QZ_DEVICE;

const chreNslNanoappInfo _chreNslDsoNanoappInfo = {
    CHRE_NSL_NANOAPP_INFO_MAGIC,
    CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION,
    /*isSystemNanoapp=*/0,
    /*isTcmNanoapp=*/0,
    /*reservedFlags=*/0,
    /*reserved=*/0,
    CHRE_API_VERSION_1_9,
    /*vendor=*/"Tamrex",
    /*name=*/"QZ",
    // "Tamre" above a 24-bit number of the vendor's.
    /*appId=*/UINT64_C(0x54616D7265001030),
    /*appVersion=*/18,
    nanoappStart,
    nanoappHandleEvent,
    nanoappEnd,
    _chreNanoappUnstableId,
    CHRE_PERMS_AUDIO,
};
}
