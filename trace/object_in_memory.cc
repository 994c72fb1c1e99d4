// SPDX-License-Identifier: Apache-2.0
#include "trace/object_in_memory.h"

#include <link.h>

#include <fstream>
#include <vector>

namespace qz::trace {
namespace {

struct LoadedFile {
  uintptr_t inside;  // an address in it
  std::string path;
  uintptr_t base = 0;  // what is to be added to the addresses of its symbols
};

int LookAt(dl_phdr_info* info, size_t, void* wanted) {
  auto* file = static_cast<LoadedFile*>(wanted);
  for (int i = 0; i < info->dlpi_phnum; ++i) {
    const ElfW(Phdr)& segment = info->dlpi_phdr[i];
    // Wraps around, and is large then, for an address before the segment.
    const uintptr_t offset = file->inside - info->dlpi_addr - segment.p_vaddr;
    if (segment.p_type != PT_LOAD || offset >= segment.p_memsz) continue;
    // The program itself has no name here.
    file->path = info->dlpi_name[0] != '\0' ? info->dlpi_name : "/proc/self/exe";
    file->base = info->dlpi_addr;
    return 1;
  }
  return 0;
}

// `count` entries of a table in the file; none if the file doesn't hold them all.
template <typename T>
std::vector<T> ReadTable(std::ifstream* file, size_t offset, size_t count) {
  file->seekg(0, std::ios::end);
  const auto end = static_cast<size_t>(file->tellg());
  if (!*file || offset > end || count > (end - offset) / sizeof(T)) return {};
  std::vector<T> table(count);
  file->seekg(static_cast<std::streamoff>(offset));
  file->read(reinterpret_cast<char*>(table.data()),
             static_cast<std::streamsize>(count * sizeof(T)));
  return table;
}

// True for the name itself and for that of an object in a namespace, as compilers write it.
bool Names(const std::string& symbol, const std::string& name) {
  const std::string in_namespace = std::to_string(name.size()) + name + "E";
  return symbol == name || (symbol.size() > in_namespace.size() &&
                            symbol.compare(symbol.size() - in_namespace.size(), in_namespace.size(),
                                           in_namespace) == 0);
}

}  // namespace

const uint8_t* FindObject(const void* inside, const std::string& name, size_t min_bytes,
                          std::string* error) {
  LoadedFile loaded{reinterpret_cast<uintptr_t>(inside), "", 0};
  dl_iterate_phdr(LookAt, &loaded);
  std::ifstream file(loaded.path, std::ios::binary);
  const auto heads = ReadTable<ElfW(Ehdr)>(&file, 0, 1);
  const auto sections = heads.empty()
                            ? std::vector<ElfW(Shdr)>()
                            : ReadTable<ElfW(Shdr)>(&file, heads[0].e_shoff, heads[0].e_shnum);
  for (const ElfW(Shdr) & section : sections) {
    if (section.sh_type != SHT_SYMTAB || section.sh_link >= sections.size()) continue;
    const ElfW(Shdr)& text = sections[section.sh_link];
    std::vector<char> names = ReadTable<char>(&file, text.sh_offset, text.sh_size);
    names.push_back('\0');
    for (const ElfW(Sym) & symbol :
         ReadTable<ElfW(Sym)>(&file, section.sh_offset, section.sh_size / sizeof(ElfW(Sym)))) {
      // Both classes of file keep the type in the same four bits.
      if (ELF32_ST_TYPE(symbol.st_info) != STT_OBJECT || symbol.st_size < min_bytes ||
          symbol.st_name >= names.size() || !Names(names.data() + symbol.st_name, name)) {
        continue;
      }
      return reinterpret_cast<const uint8_t*>(loaded.base + symbol.st_value);
    }
  }
  *error = loaded.path + ": no symbol of an object " + name + " of at least " +
           std::to_string(min_bytes) + " bytes, should be a file that was not stripped";
  return nullptr;
}

}  // namespace qz::trace
