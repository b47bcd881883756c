// The export list as the build generated it, and lookups into the loaded
// shared library.
#ifndef ZELCV_TESTS_EXPORTS_H
#define ZELCV_TESTS_EXPORTS_H

#include <string>
#include <vector>

namespace zeltest {

struct ExportEntry {
  const char* name;
  const char* implementation;
};

const std::vector<ExportEntry>& exportListing();

// Path of the loaded zelcv shared library.
std::string zelcvLibraryPath();

// Names that the file exports: those its dynamic symbol table defines
// (global or weak) on ELF, its export table's names on Windows.
std::vector<std::string> definedDynamicSymbols(const std::string& path);

// The address under which the loaded library exports `name`, or null.
const void* exportedAddress(const char* name);

// The slot that the export stub at `stub` jumps through.
const void* const* stubSlot(const void* stub);

}  // namespace zeltest

#endif  // ZELCV_TESTS_EXPORTS_H
