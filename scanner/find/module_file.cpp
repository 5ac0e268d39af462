// SPDX-License-Identifier: MIT
#include "scanner/find/module_file.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <string_view>
#include <vector>

#include <elf.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace scanner {
namespace {

constexpr std::array<std::string_view, 3> kEntryPoints = {"VSTPluginMain", "main_macho", "main"};

/// Far above any table that a module has; keeps a damaged file from costing time.
constexpr std::uint64_t kMostEntries = 1 << 20;
constexpr std::uint64_t kLongestName = 256;
/// Symbols with the same hash; a damaged table may name the same one again and again.
constexpr std::uint64_t kLongestChain = 1 << 14;

/// More pieces than are read of any module; a damaged file may send its reader in circles.
constexpr unsigned kMostReads = 1 << 18;
/// A PE file with more cannot be loaded.
constexpr std::uint64_t kMostSections = 96;

/// A file that is read in pieces. What lies outside of it reads as nothing, and so does all after kMostReads.
class File {
 public:
  explicit File(const std::string& path)
      : descriptor(open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY)) {}
  ~File() {
    if (descriptor >= 0) close(descriptor);
  }
  File(const File&) = delete;
  File& operator=(const File&) = delete;

  [[nodiscard]] bool status(struct stat& result) const {
    return descriptor >= 0 && fstat(descriptor, &result) == 0;
  }

  /// Exactly `size` bytes, or an empty string.
  [[nodiscard]] std::string bytes(std::uint64_t at, std::uint64_t size) const {
    if (at > INT64_MAX || size > 64 * kMostEntries || ++reads > kMostReads) return {};
    std::string result(static_cast<std::size_t>(size), '\0');
    const ssize_t count = pread(descriptor, result.data(), result.size(), static_cast<off_t>(at));
    return count == static_cast<ssize_t>(size) ? result : std::string();
  }

  /// The zero-terminated text at `at`; empty where none ends within kLongestName bytes.
  [[nodiscard]] std::string text(std::uint64_t at) const {
    if (at > INT64_MAX || ++reads > kMostReads) return {};
    char buffer[kLongestName];
    const ssize_t count = pread(descriptor, buffer, sizeof buffer, static_cast<off_t>(at));
    if (count <= 0) return {};
    const void* end = std::memchr(buffer, '\0', static_cast<std::size_t>(count));
    return end == nullptr ? std::string() : std::string(buffer);
  }

 private:
  int descriptor;
  mutable unsigned reads = 0;
};

/// Numbers at offsets of a piece of a file, in its byte order. What lies outside is 0.
class Piece {
 public:
  Piece(std::string content_, bool isBigEndian_) : content(std::move(content_)), isBigEndian(isBigEndian_) {}

  [[nodiscard]] std::uint64_t number(std::uint64_t at, unsigned size) const {
    if (at > content.size() || size > content.size() - at) return 0;
    std::uint64_t value = 0;
    for (unsigned i = 0; i < size; ++i) {
      const unsigned place = isBigEndian ? i : size - 1 - i;
      value = value << 8 | static_cast<unsigned char>(content[static_cast<std::size_t>(at) + place]);
    }
    return value;
  }
  [[nodiscard]] std::uint64_t u16(std::uint64_t at) const { return number(at, 2); }
  [[nodiscard]] std::uint64_t u32(std::uint64_t at) const { return number(at, 4); }
  [[nodiscard]] bool isEmpty() const { return content.empty(); }

 private:
  std::string content;
  bool isBigEndian;
};

bool isEntryPoint(std::string_view name) {
  return std::find(kEntryPoints.begin(), kEntryPoints.end(), name) != kEntryPoints.end();
}

// ---- ELF --------------------------------------------------------------------------------------------------

struct Processor {
  unsigned machine;
  unsigned elfClass;
  unsigned byteOrder;
  const char* name;
};

constexpr Processor kProcessors[] = {
    {EM_X86_64, ELFCLASS64, ELFDATA2LSB, "x86_64"},   {EM_386, ELFCLASS32, ELFDATA2LSB, "i386"},
    {EM_X86_64, ELFCLASS32, ELFDATA2LSB, "x32"},      {EM_AARCH64, ELFCLASS64, ELFDATA2LSB, "aarch64"},
    {EM_ARM, ELFCLASS32, ELFDATA2LSB, "arm"},         {EM_LOONGARCH, ELFCLASS64, ELFDATA2LSB, "loongarch64"},
    {EM_MIPS, ELFCLASS32, ELFDATA2MSB, "mips"},       {EM_MIPS, ELFCLASS32, ELFDATA2LSB, "mipsel"},
    {EM_MIPS, ELFCLASS64, ELFDATA2LSB, "mips64el"},   {EM_PPC, ELFCLASS32, ELFDATA2MSB, "powerpc"},
    {EM_PPC64, ELFCLASS64, ELFDATA2MSB, "powerpc64"}, {EM_PPC64, ELFCLASS64, ELFDATA2LSB, "powerpc64le"},
    {EM_RISCV, ELFCLASS64, ELFDATA2LSB, "riscv64"},   {EM_S390, ELFCLASS32, ELFDATA2MSB, "s390"},
    {EM_S390, ELFCLASS64, ELFDATA2MSB, "s390x"},
};

/// Offsets of the fields that are read, which differ with the word size.
struct ElfLayout {
  unsigned word;  ///< Size of an address.
  unsigned headerSize;
  unsigned phoff, phentsize, phnum;  ///< In the header.
  unsigned programOffset, programAddress, programFileSize;
  unsigned symbolSize, symbolInfo, symbolSection;
};
constexpr ElfLayout k32Bit = {4, 52, 28, 42, 44, 4, 8, 16, 16, 12, 14};
constexpr ElfLayout k64Bit = {8, 64, 32, 54, 56, 8, 16, 32, 24, 4, 6};

class Elf {
 public:
  Elf(const File& file_, const std::string& identification)
      : file(file_),
        elfClass(static_cast<unsigned char>(identification[EI_CLASS])),
        byteOrder(static_cast<unsigned char>(identification[EI_DATA])),
        layout(elfClass == ELFCLASS32 ? k32Bit : k64Bit),
        header(piece(0, layout.headerSize)) {}

  [[nodiscard]] Target target() const {
    const auto machine = static_cast<unsigned>(header.u16(18));
    for (const Processor& known : kProcessors) {
      if (known.machine == machine && known.elfClass == elfClass && known.byteOrder == byteOrder)
        return {Target::System::kLinux, known.name};
    }
    return {Target::System::kLinux, "machine " + std::to_string(machine)};
  }

  [[nodiscard]] bool isModule() {
    if (header.isEmpty() || header.u16(16) != ET_DYN) return false;
    readSegments();
    readDynamicTable();
    // A program may export main as well; it names the loader that runs it.
    for (const std::string_view name : kEntryPoints) {
      if (exportsFunction(name) && (!hasInterpreter || name == kEntryPoints[0])) return true;
    }
    return false;
  }

 private:
  struct Segment {
    std::uint64_t address, offset, size;
  };

  [[nodiscard]] Piece piece(std::uint64_t at, std::uint64_t size) const {
    return {file.bytes(at, size), byteOrder == ELFDATA2MSB};
  }

  void readSegments() {
    const std::uint64_t table = header.number(layout.phoff, layout.word);
    const std::uint64_t entrySize = header.u16(layout.phentsize);
    const std::uint64_t count = header.u16(layout.phnum);
    for (std::uint64_t i = 0; i < count; ++i) {
      const Piece entry = piece(table + i * entrySize, entrySize);
      const Segment segment = {entry.number(layout.programAddress, layout.word),
                               entry.number(layout.programOffset, layout.word),
                               entry.number(layout.programFileSize, layout.word)};
      switch (entry.u32(0)) {
        case PT_LOAD:
          loaded.push_back(segment);
          break;
        case PT_DYNAMIC:
          dynamic = segment;
          break;
        case PT_INTERP:
          hasInterpreter = true;
          break;
        default:
          break;
      }
    }
  }

  /// Where in the file an address lies; 0, which is the header, where it lies nowhere.
  [[nodiscard]] std::uint64_t offsetOf(std::uint64_t address) const {
    for (const Segment& segment : loaded) {
      if (address >= segment.address && address - segment.address < segment.size)
        return segment.offset + (address - segment.address);
    }
    return 0;
  }

  void readDynamicTable() {
    const unsigned entrySize = 2 * layout.word;
    const std::uint64_t count = std::min<std::uint64_t>(dynamic.size / entrySize, 4096);
    const Piece table = piece(dynamic.offset, count * entrySize);
    for (std::uint64_t i = 0; i < count; ++i) {
      const std::uint64_t tag = table.number(i * entrySize, layout.word);
      const std::uint64_t value = table.number(i * entrySize + layout.word, layout.word);
      switch (tag) {
        case DT_NULL:
          return;
        case DT_SYMTAB:
          symbols = offsetOf(value);
          break;
        case DT_STRTAB:
          names = offsetOf(value);
          break;
        case DT_HASH:
          hash = offsetOf(value);
          break;
        case 0x6ffffef5:  // DT_GNU_HASH
          gnuHash = offsetOf(value);
          break;
        default:
          break;
      }
    }
  }

  [[nodiscard]] bool exportsFunction(std::string_view name) const {
    if (symbols == 0 || names == 0) return false;
    if (gnuHash != 0) return isInGnuHash(name);
    return hash != 0 && isInHash(name);
  }

  [[nodiscard]] bool isDefinedAs(std::uint64_t symbol, std::string_view name) const {
    const Piece entry = piece(symbols + symbol * layout.symbolSize, layout.symbolSize);
    const std::uint64_t type = entry.number(layout.symbolInfo, 1) & 0xF;
    const std::uint64_t section = entry.u16(layout.symbolSection);
    return section != SHN_UNDEF && (type == STT_FUNC || type == STT_GNU_IFUNC) &&
           file.text(names + entry.u32(0)) == name;
  }

  [[nodiscard]] bool isInHash(std::string_view name) const {
    std::uint32_t value = 0;
    for (const char c : name) {
      value = (value << 4) + static_cast<unsigned char>(c);
      value ^= value >> 24 & 0xF0;
    }
    value &= 0x0FFFFFFF;
    const Piece counts = piece(hash, 8);
    const std::uint64_t buckets = counts.u32(0);
    const std::uint64_t chains = counts.u32(4);
    if (buckets == 0) return false;
    std::uint64_t symbol = piece(hash + 8 + 4 * (value % buckets), 4).u32(0);
    for (std::uint64_t i = 0; symbol != STN_UNDEF && symbol < chains && i < kLongestChain; ++i) {
      if (isDefinedAs(symbol, name)) return true;
      symbol = piece(hash + 8 + 4 * (buckets + symbol), 4).u32(0);
    }
    return false;
  }

  [[nodiscard]] bool isInGnuHash(std::string_view name) const {
    std::uint32_t value = 5381;
    for (const char c : name) value = value * 33 + static_cast<unsigned char>(c);
    const Piece counts = piece(gnuHash, 16);
    const std::uint64_t buckets = counts.u32(0);
    const std::uint64_t firstSymbol = counts.u32(4);
    const std::uint64_t bloomWords = counts.u32(8);
    if (buckets == 0) return false;
    const std::uint64_t bucketTable = gnuHash + 16 + bloomWords * layout.word;
    const std::uint64_t chainTable = bucketTable + 4 * buckets;
    std::uint64_t symbol = piece(bucketTable + 4 * (value % buckets), 4).u32(0);
    if (symbol < firstSymbol) return false;
    for (std::uint64_t i = 0; i < kLongestChain; ++i, ++symbol) {
      const Piece chain = piece(chainTable + 4 * (symbol - firstSymbol), 4);
      if (chain.isEmpty()) return false;
      const std::uint64_t chained = chain.u32(0);
      if ((chained | 1) == (value | 1U) && isDefinedAs(symbol, name)) return true;
      if ((chained & 1) != 0) return false;
    }
    return false;
  }

  const File& file;
  unsigned elfClass;
  unsigned byteOrder;
  const ElfLayout& layout;
  Piece header;
  std::vector<Segment> loaded;
  Segment dynamic = {0, 0, 0};
  bool hasInterpreter = false;
  std::uint64_t symbols = 0, names = 0, hash = 0, gnuHash = 0;
};

// ---- Mach-O -----------------------------------------------------------------------------------------------

std::string machProcessor(std::uint64_t type) {
  switch (type) {
    case 7:
      return "i386";
    case 0x01000007:
      return "x86_64";
    case 12:
      return "arm";
    case 0x0100000C:
      return "aarch64";
    case 18:
      return "powerpc";
    case 0x01000012:
      return "powerpc64";
    default:
      return "machine " + std::to_string(type);
  }
}

/// One image, which begins at `start`.
std::optional<Target> machImage(const File& file, std::uint64_t start) {
  const std::string magic = file.bytes(start, 4);
  const bool isBigEndian = magic == "\xFE\xED\xFA\xCE" || magic == "\xFE\xED\xFA\xCF";
  const bool is64Bit = magic == "\xFE\xED\xFA\xCF" || magic == "\xCF\xFA\xED\xFE";
  if (!isBigEndian && !is64Bit && magic != "\xCE\xFA\xED\xFE") return std::nullopt;
  const Piece header(file.bytes(start, 32), isBigEndian);
  const std::uint64_t type = header.u32(12);
  if (type != 6 && type != 8) return std::nullopt;  // A dynamic library, a bundle.
  const std::uint64_t commands = std::min<std::uint64_t>(header.u32(16), 4096);
  std::uint64_t at = start + (is64Bit ? 32 : 28);
  for (std::uint64_t i = 0; i < commands; ++i) {
    const Piece command(file.bytes(at, 24), isBigEndian);
    const std::uint64_t size = command.u32(4);
    if (size < 8) return std::nullopt;
    if (command.u32(0) == 2) {  // The symbol table.
      const std::uint64_t symbols = start + command.u32(8);
      const std::uint64_t count = std::min<std::uint64_t>(command.u32(12), kMostEntries);
      const std::uint64_t names = start + command.u32(16);
      const unsigned symbolSize = is64Bit ? 16 : 12;
      const Piece table(file.bytes(symbols, count * symbolSize), isBigEndian);
      for (std::uint64_t symbol = 0; symbol < count; ++symbol) {
        const std::uint64_t flags = table.number(symbol * symbolSize + 4, 1);
        const bool isExported = (flags & 0x01) != 0 && (flags & 0x0E) == 0x0E;
        if (!isExported) continue;
        const std::string name = file.text(names + table.u32(symbol * symbolSize));
        if (name.size() > 1 && name[0] == '_' && isEntryPoint(std::string_view(name).substr(1)))
          return Target{Target::System::kMacOs, machProcessor(header.u32(4))};
      }
      return std::nullopt;
    }
    at += size;
  }
  return std::nullopt;
}

std::optional<Target> machFile(const File& file, const std::string& magic) {
  if (magic != "\xCA\xFE\xBA\xBE" && magic != "\xCA\xFE\xBA\xBF") return machImage(file, 0);
  const bool is64Bit = magic == "\xCA\xFE\xBA\xBF";
  const unsigned entrySize = is64Bit ? 32 : 20;
  // Java classes begin with the same bytes; their next number is far above any count of processors.
  const std::uint64_t count = Piece(file.bytes(4, 4), true).u32(0);
  for (std::uint64_t i = 0; i < count && count <= 32; ++i) {
    const Piece entry(file.bytes(8 + i * entrySize, entrySize), true);
    if (auto target = machImage(file, entry.number(8, is64Bit ? 8 : 4))) return target;
  }
  return std::nullopt;
}

// ---- PE ---------------------------------------------------------------------------------------------------

std::string windowsProcessor(std::uint64_t machine) {
  switch (machine) {
    case 0x014C:
      return "i386";
    case 0x8664:
      return "x86_64";
    case 0xAA64:
      return "aarch64";
    default:
      return "machine " + std::to_string(machine);
  }
}

std::optional<Target> windowsFile(const File& file) {
  const std::uint64_t header = Piece(file.bytes(0x3C, 4), false).u32(0);
  const Piece coff(file.bytes(header, 24), false);
  constexpr std::uint64_t kLibrary = 0x2000;
  if (coff.u32(0) != 0x00004550 || (coff.u16(22) & kLibrary) == 0) return std::nullopt;
  const std::uint64_t optionalSize = coff.u16(20);
  const Piece optional(file.bytes(header + 24, optionalSize), false);
  const bool is64Bit = optional.u16(0) == 0x20B;
  const std::uint64_t exportsAddress = optional.u32(is64Bit ? 112 : 96);
  const std::uint64_t count = std::min<std::uint64_t>(coff.u16(6), kMostSections);
  const Piece sections(file.bytes(header + 24 + optionalSize, 40 * count), false);
  const auto offsetOf = [&](std::uint64_t address) -> std::uint64_t {
    for (std::uint64_t at = 0; at < 40 * count; at += 40) {
      const std::uint64_t start = sections.u32(at + 12);
      if (address >= start && address - start < sections.u32(at + 16))
        return sections.u32(at + 20) + (address - start);
    }
    return 0;
  };
  const std::uint64_t directory = offsetOf(exportsAddress);
  if (exportsAddress == 0 || directory == 0) return std::nullopt;
  const Piece exports(file.bytes(directory, 40), false);
  const std::uint64_t nameCount = std::min<std::uint64_t>(exports.u32(24), kMostEntries);
  const Piece table(file.bytes(offsetOf(exports.u32(32)), 4 * nameCount), false);
  for (std::uint64_t i = 0; i < nameCount; ++i) {
    const std::uint64_t name = offsetOf(table.u32(4 * i));
    if (name != 0 && isEntryPoint(file.text(name)))
      return Target{Target::System::kWindows, windowsProcessor(coff.u16(4))};
  }
  return std::nullopt;
}

FileIdentity identityOf(const struct stat& status) {
  FileIdentity identity;
  identity.device = static_cast<std::uint64_t>(status.st_dev);
  identity.inode = static_cast<std::uint64_t>(status.st_ino);
  identity.sizeInBytes = static_cast<std::uint64_t>(status.st_size);
#if defined(__APPLE__)
  const timespec& changed = status.st_ctimespec;
#else
  const timespec& changed = status.st_ctim;
#endif
  identity.changedAtInNanoseconds = static_cast<std::int64_t>(changed.tv_sec) * 1000000000 + changed.tv_nsec;
  return identity;
}

}  // namespace

std::optional<ModuleFile> readModuleFile(const std::string& path) {
  const File file(path);
  struct stat status = {};
  if (!file.status(status) || !S_ISREG(status.st_mode)) return std::nullopt;
  ModuleFile result = {identityOf(status), std::nullopt};
  const std::string beginning = file.bytes(0, EI_NIDENT);
  if (beginning.empty()) return result;
  const std::string magic = beginning.substr(0, 4);
  if (magic == ELFMAG) {
    Elf elf(file, beginning);
    if (elf.isModule()) result.target = elf.target();
  } else if (magic.substr(0, 2) == "MZ") {
    result.target = windowsFile(file);
  } else {
    result.target = machFile(file, magic);
  }
  return result;
}

std::optional<Target> targetOfProgram(const std::string& path) {
  const File file(path);
  const std::string beginning = file.bytes(0, EI_NIDENT);
  if (beginning.substr(0, 4) != ELFMAG) return std::nullopt;
  return Elf(file, beginning).target();
}

}  // namespace scanner
