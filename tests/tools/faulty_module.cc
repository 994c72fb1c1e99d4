// A nanoapp that a hub must complain about. FAULTY_MAGIC is that of its record; it leaks a block at
// its start, frees a block twice, and answers a client's registration with a broken report.

#include "chre.h"
#include "chre_nanoapp_info.h"

namespace {

char broken_report[] = {1, 0, 0, 0, 0x08};

bool Start() {
  chreHeapAlloc(10);
  void* block = chreHeapAlloc(10);
  chreHeapFree(block);
  chreHeapFree(block);
  return true;
}

void HandleEvent(uint32_t sender, uint16_t type, const void*) {
  constexpr uint16_t kRegister = 0x8203;
  constexpr uint16_t kReport = 0x8207;
  if (type == kRegister) chreSendEvent(kReport, broken_report, nullptr, sender);
}

void End() {}

}  // namespace

extern "C" __attribute__((visibility("default")))
const chreNslNanoappInfo _chreNslDsoNanoappInfo = {FAULTY_MAGIC,
                                                   CHRE_NSL_NANOAPP_INFO_STRUCT_MINOR_VERSION,
                                                   0,
                                                   0,
                                                   0,
                                                   0,
                                                   CHRE_API_VERSION_1_9,
                                                   "tests",
                                                   "faulty",
                                                   1,
                                                   1,
                                                   Start,
                                                   HandleEvent,
                                                   End,
                                                   "faulty",
                                                   CHRE_PERMS_AUDIO};
