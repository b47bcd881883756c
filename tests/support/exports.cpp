#include "support/exports.h"

#if defined(_WIN32)
#include <windows.h>
#else
#include <dlfcn.h>
#include <elf.h>
#include <link.h>
#endif

#include <cstddef>
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

#if defined(_WIN32)
namespace {
HMODULE zelcvModule() {
  HMODULE module = nullptr;
  GetModuleHandleExA(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                     reinterpret_cast<LPCSTR>(&zelcvGetLibVersion), &module);
  return module;
}

template <typename T>
bool readAt(const std::vector<char>& file, size_t offset, T* value) {
  if (offset > file.size() || file.size() - offset < sizeof(T)) return false;
  std::memcpy(value, file.data() + offset, sizeof(T));
  return true;
}
}  // namespace

std::string zelcvLibraryPath() {
  HMODULE module = zelcvModule();
  char path[MAX_PATH];
  if (!module || !GetModuleFileNameA(module, path, sizeof path)) return {};
  return path;
}

// Reads the export directory of the PE file (either width).
std::vector<std::string> definedDynamicSymbols(const std::string& path) {
  std::ifstream in(path, std::ios::binary);
  std::vector<char> file((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
  std::vector<std::string> names;
  IMAGE_DOS_HEADER dos;
  IMAGE_FILE_HEADER header;
  uint16_t magic;
  if (!readAt(file, 0, &dos) || !readAt(file, dos.e_lfanew + 4, &header)) return names;
  size_t optional = dos.e_lfanew + 4 + sizeof(IMAGE_FILE_HEADER);
  if (!readAt(file, optional, &magic)) return names;
  IMAGE_DATA_DIRECTORY directory;
  size_t directories = optional + (magic == IMAGE_NT_OPTIONAL_HDR64_MAGIC
                                       ? offsetof(IMAGE_OPTIONAL_HEADER64, DataDirectory)
                                       : offsetof(IMAGE_OPTIONAL_HEADER32, DataDirectory));
  if (!readAt(file, directories + IMAGE_DIRECTORY_ENTRY_EXPORT * sizeof directory, &directory)) return names;
  size_t sectionTable = optional + header.SizeOfOptionalHeader;
  auto fileOffset = [&](uint32_t rva) -> size_t {
    for (int i = 0; i < header.NumberOfSections; ++i) {
      IMAGE_SECTION_HEADER section;
      if (!readAt(file, sectionTable + i * sizeof section, &section)) break;
      if (rva >= section.VirtualAddress && rva < section.VirtualAddress + section.SizeOfRawData)
        return rva - section.VirtualAddress + section.PointerToRawData;
    }
    return file.size();
  };
  IMAGE_EXPORT_DIRECTORY exports;
  if (directory.Size == 0 || !readAt(file, fileOffset(directory.VirtualAddress), &exports)) return names;
  for (DWORD i = 0; i < exports.NumberOfNames; ++i) {
    uint32_t nameRva;
    if (!readAt(file, fileOffset(exports.AddressOfNames) + 4 * i, &nameRva)) break;
    size_t at = fileOffset(nameRva);
    if (at >= file.size()) break;
    names.emplace_back(file.data() + at, strnlen(file.data() + at, file.size() - at));
  }
  return names;
}

const void* exportedAddress(const char* name) {
  HMODULE module = zelcvModule();
  return module ? reinterpret_cast<const void*>(GetProcAddress(module, name)) : nullptr;
}

#else

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

const void* exportedAddress(const char* name) {
  static void* library = dlopen(zelcvLibraryPath().c_str(), RTLD_NOW | RTLD_NOLOAD);
  return library ? dlsym(library, name) : nullptr;
}

#endif

const void* const* stubSlot(const void* stub) {
  const auto* code = static_cast<const uint8_t*>(stub);
#if defined(_WIN32) && defined(__i386__)
  // jmp *abs32 (the loader relocates the address)
  if (code[0] != 0xFF || code[1] != 0x25) return nullptr;
  uint32_t address;
  std::memcpy(&address, code + 2, 4);
  return reinterpret_cast<const void* const*>(static_cast<uintptr_t>(address));
#elif defined(__x86_64__)
  // jmp *disp32(%rip)
  if (code[0] != 0xFF || code[1] != 0x25) return nullptr;
  int32_t displacement;
  std::memcpy(&displacement, code + 2, 4);
  return reinterpret_cast<const void* const*>(code + 6 + displacement);
#else
  // call thunk (eax = address after the call); jmp *disp32(%eax)
  if (code[0] != 0xE8 || code[5] != 0xFF || code[6] != 0xA0) return nullptr;
  int32_t displacement;
  std::memcpy(&displacement, code + 7, 4);
  return reinterpret_cast<const void* const*>(code + 5 + displacement);
#endif
}

}  // namespace zeltest
