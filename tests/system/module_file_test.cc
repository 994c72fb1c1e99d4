// SPDX-License-Identifier: Apache-2.0
// The module as a loader sees it, read back from the file: what it exports and imports, its
// record, what of it is constant, and that nothing runs at load.

#include <gmock/gmock.h>

#include "chre_nanoapp_info.h"
#include "tests/system/elf_file.h"

namespace qz::test {
namespace {

using ::testing::AnyOf;
using ::testing::ElementsAre;

class ModuleFile : public testing::Test {
 protected:
  // Dynamic symbols that the module defines, or those that it does not.
  std::set<std::string> DynamicSymbols(bool defined) const {
    std::set<std::string> names;
    for (const auto& [name, symbol] : file_.Symbols(".dynsym")) {
      if ((symbol.st_shndx != SHN_UNDEF) == defined) names.insert(name);
    }
    return names;
  }
  ElfFile::Symbol Defined(const std::string& name) const {
    const auto symbols = file_.Symbols(".symtab");
    const auto found = symbols.find(name);
    return found == symbols.end() ? ElfFile::Symbol{} : found->second;
  }
  ElfFile::Address Location(const std::string& name) const { return Defined(name).st_value; }

  const ElfFile file_{QZ_MODULE};
};

TEST_F(ModuleFile, ExportsTheRecordAndTheUnstableId) {
  EXPECT_THAT(DynamicSymbols(true),
              ElementsAre("_chreNanoappUnstableId", "_chreNslDsoNanoappInfo"));
}

TEST_F(ModuleFile, HoldsTheUnstableIdInASectionOfItsOwn) {
  const std::string id = "nanoapp=qz@" QZ_BUILD_NUMBER "~" QZ_DEVICE;
  const ElfFile::Section& section = file_.sections.at(".unstable_id");
  EXPECT_EQ(file_.Loaded(section.sh_addr, section.sh_size), id + '\0');
  EXPECT_EQ(section.sh_flags, ElfW(Word){SHF_ALLOC});
  EXPECT_EQ(Location("_chreNanoappUnstableId"), section.sh_addr);
}

TEST_F(ModuleFile, HoldsTheRecord) {
  const ElfFile::Address at = Location("_chreNslDsoNanoappInfo");
  constexpr size_t kVendor = offsetof(chreNslNanoappInfo, vendor);
  constexpr size_t kAppId = offsetof(chreNslNanoappInfo, appId);
  constexpr size_t kStart = offsetof(chreNslNanoappInfo, start);
#if __SIZEOF_POINTER__ == 4
  // The layout that loaders of hubs know, with four bytes of padding before the app ID.
  EXPECT_EQ(kVendor, 12u);
  EXPECT_EQ(file_.Loaded(at + 20, 4), std::string(4, '\0'));
  EXPECT_EQ(kAppId, 24u);
  EXPECT_EQ(kStart, 36u);
  EXPECT_EQ(Defined("_chreNslDsoNanoappInfo").st_size, 56u);
#endif
  // Magic, version 3, no flag, nothing in the reserved and padding bytes, API 1.9.
  EXPECT_EQ(file_.Loaded(at, 12), std::string("\x77\x99\xE6\x50\3\0\0\0\0\0\x09\1", 12));
  // "Tamre" and 0x001030, then version 18.
  EXPECT_EQ(file_.Loaded(at + kAppId, 12), std::string("\x30\x10\0ermaT\x12\0\0\0", 12));

  constexpr size_t kPointer = sizeof(void*);
  EXPECT_EQ(file_.LoadedString(file_.Pointer(at + kVendor)), "Tamrex");
  EXPECT_EQ(file_.LoadedString(file_.Pointer(at + kVendor + kPointer)), "QZ");
  EXPECT_EQ(file_.Pointer(at + kStart), Location("nanoappStart"));
  EXPECT_EQ(file_.Pointer(at + kStart + kPointer), Location("nanoappHandleEvent"));
  EXPECT_EQ(file_.Pointer(at + kStart + 2 * kPointer), Location("nanoappEnd"));
  EXPECT_EQ(file_.Pointer(at + kStart + 3 * kPointer), Location("_chreNanoappUnstableId"));
  EXPECT_EQ(file_.Loaded(at + kStart + 4 * kPointer, 4), std::string("\1\0\0\0", 4));
}

// Sanitizers bring libraries, constructors and tables of their own.
#ifndef QZ_SANITIZED

TEST_F(ModuleFile, ImportsTheRuntimeAndLittleElse) {
  EXPECT_THAT(
      DynamicSymbols(false),
      ElementsAre("chreGetEstimatedHostTimeOffset", "chreGetTime", "chreHeapAlloc", "chreHeapFree",
                  "chreLog", "chreSendEvent", "chreSendMessageToHostEndpoint",
                  "chrexClockRateChangeRequest", "dlsym", "memcpy", "memmove", "memset"));
  EXPECT_THAT(file_.Reported(DT_NEEDED), ElementsAre("libc.so.6", "libchre_runtime.so"));
  // No folder of the machine that built it.
  EXPECT_THAT(file_.Reported(DT_RUNPATH), ElementsAre("$ORIGIN"));
}

TEST_F(ModuleFile, RunsNothingAtLoadAndUnwindsNothing) {
  for (const char* name : {".init", ".init_array", ".preinit_array", ".ctors", ".fini",
                           ".fini_array", ".tdata", ".tbss", ".gcc_except_table", ".ARM.exidx"}) {
    EXPECT_EQ(file_.sections.count(name), 0u) << name;
  }
}

TEST_F(ModuleFile, KeepsAllButItsStateReadOnly) {
  EXPECT_EQ(file_.SegmentOf(PT_GNU_STACK).p_flags, ElfW(Word){PF_R | PF_W});
  const ElfFile::Segment relro = file_.SegmentOf(PT_GNU_RELRO);
  std::set<std::string> writable;
  for (const auto& [name, section] : file_.sections) {
    const bool after_load = section.sh_addr < relro.p_vaddr ||
                            section.sh_addr + section.sh_size > relro.p_vaddr + relro.p_memsz;
    if ((section.sh_flags & SHF_WRITE) != 0 && after_load) writable.insert(name);
  }
  EXPECT_THAT(writable, ElementsAre(".bss"));

  const ElfFile::Section& bss = file_.sections.at(".bss");
  std::multiset<std::string> state;
  for (const auto& [name, symbol] : file_.Symbols(".symtab")) {
    const bool object = ELF32_ST_TYPE(symbol.st_info) == STT_OBJECT;
    if (!object || symbol.st_value - bss.sh_addr >= bss.sh_size) continue;
    state.insert(name.substr(name.rfind(':') + 1));
  }
  // On a PC, of either component: which kernels have been chosen.
  EXPECT_THAT(state.erase("chosen"), AnyOf(0u, 2u));
#ifdef QZ_MODULE_HAS_window
  const std::multiset<std::string> network = {"arena", "feature_count", "inference_input_buffer"};
#else
  const std::multiset<std::string> network = {"module_stream"};
#endif
  std::multiset<std::string> expected = {
      // The front end's, its noise estimates, the classifier's.
      "arena", "state", "state_initialized", "sample_count", "frontend_input_buffer",
      // The application's one object, and what it has bound of the runtime.
      "sObject", "sIsInitialized", "lookupPerformed", "lookupPerformed", "funcPtr", "funcPtr"};
  expected.insert(network.begin(), network.end());
  EXPECT_EQ(state, expected);
}

// The other engine is not there to be called.
TEST_F(ModuleFile, HoldsOneNetwork) {
#ifdef QZ_MODULE_HAS_window
  EXPECT_NE(Location("mobilenet_backend_invoke"), 0u);
  EXPECT_EQ(Location("stream_backend_push"), 0u);
#else
  EXPECT_EQ(Location("mobilenet_backend_invoke"), 0u);
  EXPECT_NE(Location("stream_backend_push"), 0u);
#endif
}

#endif

}  // namespace
}  // namespace qz::test
