// SPDX-License-Identifier: Apache-2.0
// A plug-in for qemu-arm that counts the instructions a program executes. The count is the same on
// every machine and in every run.
//
//   qemu-arm -plugin instruction_counter.so,out=FILE[,blocks=on] PROGRAM...
//
// FILE receives the count so far, in a line of its own, at each of the program's marks
// (instruction_mark.h); with blocks=on also, at the end, a line "block ADDRESS COUNT" for each
// straight run of code: how many instructions were executed in it.

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <map>
#include <string>

#include "tests/support/instruction_mark.h"

// What the emulator offers to its plug-ins, version 1 of that interface, as far as it is used here.
extern "C" {
struct qemu_plugin_tb;
void qemu_plugin_register_vcpu_tb_trans_cb(uint64_t plugin,
                                           void (*call)(uint64_t, qemu_plugin_tb*));
void qemu_plugin_register_vcpu_tb_exec_inline(qemu_plugin_tb* block, int operation, void* number,
                                              uint64_t operand);
size_t qemu_plugin_tb_n_insns(const qemu_plugin_tb* block);
uint64_t qemu_plugin_tb_vaddr(const qemu_plugin_tb* block);
void qemu_plugin_register_vcpu_syscall_cb(uint64_t plugin,
                                          void (*call)(uint64_t, unsigned, int64_t, uint64_t,
                                                       uint64_t, uint64_t, uint64_t, uint64_t,
                                                       uint64_t, uint64_t, uint64_t));
void qemu_plugin_register_atexit_cb(uint64_t plugin, void (*call)(uint64_t, void*), void* data);

__attribute__((visibility("default"))) int qemu_plugin_version = 1;
}

namespace {

constexpr int kAdd = 0;

std::FILE* out;
bool write_blocks;
uint64_t executed;
std::map<uint64_t, uint64_t> executed_in_block;  // by address; its nodes stay where they are

void OnTranslation(uint64_t, qemu_plugin_tb* block) {
  const uint64_t instructions = qemu_plugin_tb_n_insns(block);
  qemu_plugin_register_vcpu_tb_exec_inline(block, kAdd, &executed, instructions);
  if (!write_blocks) return;
  qemu_plugin_register_vcpu_tb_exec_inline(
      block, kAdd, &executed_in_block[qemu_plugin_tb_vaddr(block)], instructions);
}

void OnSystemCall(uint64_t, unsigned, int64_t, uint64_t descriptor, uint64_t, uint64_t, uint64_t,
                  uint64_t, uint64_t, uint64_t, uint64_t) {
  if (static_cast<uint32_t>(descriptor) == static_cast<uint32_t>(qz::test::kMarkDescriptor)) {
    std::fprintf(out, "%llu\n", static_cast<unsigned long long>(executed));
  }
}

void OnExit(uint64_t, void*) {
  for (const auto& [address, count] : executed_in_block) {
    std::fprintf(out, "block %llx %llu\n", static_cast<unsigned long long>(address),
                 static_cast<unsigned long long>(count));
  }
  std::fclose(out);
}

}  // namespace

extern "C" __attribute__((visibility("default"))) int qemu_plugin_install(uint64_t plugin,
                                                                          const void*, int count,
                                                                          char** arguments) {
  for (int i = 0; i < count; ++i) {
    const std::string argument = arguments[i];
    if (argument.rfind("out=", 0) == 0) {
      out = std::fopen(argument.c_str() + 4, "w");
    } else if (argument == "blocks=on") {
      write_blocks = true;
    } else {
      std::fprintf(stderr,
                   "instruction_counter: no argument '%s', should be out=FILE or blocks=on\n",
                   argument.c_str());
      return 1;
    }
  }
  if (out == nullptr) {
    std::fprintf(stderr, "instruction_counter: out=FILE is missing or can't be written\n");
    return 1;
  }
  qemu_plugin_register_vcpu_tb_trans_cb(plugin, OnTranslation);
  qemu_plugin_register_vcpu_syscall_cb(plugin, OnSystemCall);
  qemu_plugin_register_atexit_cb(plugin, OnExit, nullptr);
  return 0;
}
