// Modules that a hub must refuse: without a record, or with one whose magic is off by one.

#include "chre.h"
#include "chre_nanoapp_info.h"

#ifdef QZ_WITH_RECORD
extern "C" {
extern const chreNslNanoappInfo _chreNslDsoNanoappInfo;
const chreNslNanoappInfo _chreNslDsoNanoappInfo = {
    CHRE_NSL_NANOAPP_INFO_MAGIC + 1,
    CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION,
    0,
    0,
    0,
    0,
    CHRE_API_VERSION_1_9,
    "vendor",
    "name",
    0,
    0,
    [] { return true; },
    [](uint32_t, uint16_t, const void*) {},
    [] {},
    "",
    CHRE_PERMS_AUDIO,
};
}
#endif
