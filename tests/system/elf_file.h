// SPDX-License-Identifier: Apache-2.0
// A shared library as its loader reads it, of the processor and class that this program runs on.
#pragma once

#include <cxxabi.h>
#include <link.h>

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <map>
#include <memory>
#include <set>
#include <string>
#include <vector>

namespace qz::test {

class ElfFile {
 public:
  using Address = ElfW(Addr);
  using Section = ElfW(Shdr);
  using Segment = ElfW(Phdr);
  using Symbol = ElfW(Sym);

  explicit ElfFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    bytes_.assign(std::istreambuf_iterator<char>(file), {});
    const auto header = At<ElfW(Ehdr)>(0);
    for (size_t i = 0; i < header.e_shnum; ++i) {
      list_.push_back(At<Section>(header.e_shoff + i * sizeof(Section)));
    }
    for (size_t i = 0; i < header.e_phnum; ++i) {
      segments.push_back(At<Segment>(header.e_phoff + i * sizeof(Segment)));
    }
    for (const Section& section : list_) {
      sections[String(list_.at(header.e_shstrndx), section.sh_name)] = section;
    }
  }

  // The names in a symbol table, demangled, with their symbols; unnamed ones are left out.
  std::multimap<std::string, Symbol> Symbols(const std::string& table) const {
    const Section& section = sections.at(table);
    std::multimap<std::string, Symbol> symbols;
    for (size_t i = 0; i < section.sh_size / sizeof(Symbol); ++i) {
      const auto symbol = At<Symbol>(section.sh_offset + i * sizeof(Symbol));
      const std::string name = String(list_.at(section.sh_link), symbol.st_name);
      if (!name.empty()) symbols.emplace(Demangled(name), symbol);
    }
    return symbols;
  }

  // The values of a tag such as DT_NEEDED, of those that name a file or folder.
  std::set<std::string> Reported(int tag) const {
    const Section& section = sections.at(".dynamic");
    std::set<std::string> names;
    for (size_t i = 0; i < section.sh_size / sizeof(ElfW(Dyn)); ++i) {
      const auto entry = At<ElfW(Dyn)>(section.sh_offset + i * sizeof(ElfW(Dyn)));
      if (entry.d_tag == tag) names.insert(String(sections.at(".dynstr"), entry.d_un.d_val));
    }
    return names;
  }

  // The one segment of a type; an empty one if there is none.
  Segment SegmentOf(unsigned type) const {
    for (const Segment& segment : segments) {
      if (segment.p_type == type) return segment;
    }
    return {};
  }

  // `size` bytes of the file that are loaded at an address.
  std::string Loaded(Address address, size_t size) const {
    for (const Segment& segment : segments) {
      const Address within = address - segment.p_vaddr;
      if (segment.p_type == PT_LOAD && within < segment.p_filesz &&
          size <= segment.p_filesz - within) {
        return bytes_.substr(segment.p_offset + within, size);
      }
    }
    return {};
  }
  std::string LoadedString(Address address) const {
    std::string string;
    for (std::string c; !(c = Loaded(address + string.size(), 1)).empty() && c[0] != 0;)
      string += c;
    return string;
  }

  // Where the pointer at a location points once its relocation has been applied, before the
  // module's base is added; 0 when it has none.
  Address Pointer(Address location) const {
#if __SIZEOF_POINTER__ == 4
    using Relocation = ElfW(Rel);
    const char* const table = ".rel.dyn";
    const auto addend = [this](const Relocation& r) {
      Address value = 0;
      const std::string bytes = Loaded(r.r_offset, sizeof(value));
      std::memcpy(&value, bytes.data(), bytes.size());
      return value;
    };
    const auto symbol_of = [](const Relocation& r) { return ELF32_R_SYM(r.r_info); };
#else
    using Relocation = ElfW(Rela);
    const char* const table = ".rela.dyn";
    const auto addend = [](const Relocation& r) { return static_cast<Address>(r.r_addend); };
    const auto symbol_of = [](const Relocation& r) { return ELF64_R_SYM(r.r_info); };
#endif
    const Section& section = sections.at(table);
    for (size_t i = 0; i < section.sh_size / sizeof(Relocation); ++i) {
      const auto r = At<Relocation>(section.sh_offset + i * sizeof(Relocation));
      if (r.r_offset != location) continue;
      const auto symbol =
          At<Symbol>(sections.at(".dynsym").sh_offset + symbol_of(r) * sizeof(Symbol));
      return symbol.st_value + addend(r);
    }
    return 0;
  }

  std::map<std::string, Section> sections;
  std::vector<Segment> segments;

 private:
  template <typename T>
  T At(size_t offset) const {
    T value;
    std::memcpy(&value, bytes_.substr(offset, sizeof(T)).data(), sizeof(T));
    return value;
  }
  std::string String(const Section& table, size_t index) const {
    return bytes_.c_str() + table.sh_offset + index;
  }
  static std::string Demangled(const std::string& name) {
    const std::unique_ptr<char, decltype(&std::free)> demangled(
        abi::__cxa_demangle(name.c_str(), nullptr, nullptr, nullptr), std::free);
    return demangled ? demangled.get() : name;
  }

  std::string bytes_;
  std::vector<Section> list_;
};

}  // namespace qz::test
