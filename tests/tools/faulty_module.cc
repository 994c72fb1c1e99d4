// SPDX-License-Identifier: Apache-2.0
// A nanoapp that a hub must complain about. FAULTY_MAGIC is that of its record; it leaks a block at
// its start, frees a block twice, and answers a client's registration with a broken report.

#include "chre.h"
#include "tests/support/nanoapp_record.h"

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

}  // namespace

extern "C" __attribute__((visibility("default"))) const chreNslNanoappInfo _chreNslDsoNanoappInfo =
    qz::test::NanoappRecord(
        Start, HandleEvent, [] {}, FAULTY_MAGIC);
