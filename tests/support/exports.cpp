#include "support/exports.h"

#include <dlfcn.h>
#include <elf.h>
#include <link.h>

#include <cstdint>
#include <cstring>
#include <fstream>
#include <iterator>

#include "zelcv.h"

namespace zeltest {

const std::vector<ExportEntry>& exportListing() {
  static const std::vector<ExportEntry> listing = {
#include "export_listing.inc"
  };
  return listing;
}

std::string zelcvLibraryPath() {
  Dl_info info{};
  if (!dladdr(reinterpret_cast<void*>(&zelcvGetLibVersion), &info) || !info.dli_fname) return {};
  return info.dli_fname;
}

std::vector<std::string> definedDynamicSymbols(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::vector<char> file((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  std::vector<std::string> names;
  if (file.size() < sizeof(ElfW(Ehdr))) return names;
  const auto* header = reinterpret_cast<const ElfW(Ehdr)*>(file.data());
  const auto* sections = reinterpret_cast<const ElfW(Shdr)*>(file.data() + header->e_shoff);
  for (int i = 0; i < header->e_shnum; ++i) {
    if (sections[i].sh_type != SHT_DYNSYM) continue;
    const char* strings = file.data() + sections[sections[i].sh_link].sh_offset;
    const auto* symbols = reinterpret_cast<const ElfW(Sym)*>(file.data() + sections[i].sh_offset);
    size_t count = sections[i].sh_size / sizeof(ElfW(Sym));
    for (size_t s = 1; s < count; ++s) {
      int binding = ELF32_ST_BIND(symbols[s].st_info);  // same layout in both classes
      if (symbols[s].st_shndx == SHN_UNDEF) continue;
      if (binding != STB_GLOBAL && binding != STB_WEAK) continue;
      names.emplace_back(strings + symbols[s].st_name);
    }
  }
  return names;
}

const void* const* stubSlot(const void* stub) {
  const auto* code = static_cast<const uint8_t*>(stub);
  int32_t displacement;
#if defined(__x86_64__)
  // jmp *disp32(%rip)
  if (code[0] != 0xFF || code[1] != 0x25) return nullptr;
  std::memcpy(&displacement, code + 2, 4);
  return reinterpret_cast<const void* const*>(code + 6 + displacement);
#else
  // call thunk (eax = address after the call); jmp *disp32(%eax)
  if (code[0] != 0xE8 || code[5] != 0xFF || code[6] != 0xA0) return nullptr;
  std::memcpy(&displacement, code + 7, 4);
  return reinterpret_cast<const void* const*>(code + 5 + displacement);
#endif
}

}  // namespace zeltest
