// SPDX-License-Identifier: Apache-2.0
#include "arrays/npz_file.h"

#include <unzip.h>
#include <zip.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>

#include "base/error.h"

namespace qz::arrays {
namespace {

constexpr char kSuffix[] = ".npy";
constexpr size_t kSuffixLength = 4;
constexpr unsigned kFirstOfJanuary1980 = 1 << 21 | 1 << 16;  // the first day that a zip file knows

struct UnzipCloser {
  void operator()(void* archive) const { unzClose(archive); }
};
using Archive = std::unique_ptr<void, UnzipCloser>;

Archive OpenArchive(const std::string& path) {
  // For the reason, which the archive's library keeps to itself.
  std::FILE* file = std::fopen(path.c_str(), "rb");
  if (file == nullptr) {
    throw base::InputError(path + ": can't be opened: " + std::strerror(errno));
  }
  std::fclose(file);
  Archive archive(unzOpen64(path.c_str()));
  if (archive == nullptr) throw base::InputError(path + ": not an archive of arrays (.npz)");
  return archive;
}

// Fit to be shown.
std::string Printable(std::string name) {
  for (char& c : name) {
    if (c < ' ' || c > '~') c = '?';
  }
  return name;
}

// Reads the files of an archive, one after the other.
class NpzReader {
 public:
  NpzReader(const std::string& path, const NpzLimits& limits)
      : path_(path), limits_(limits), archive_(OpenArchive(path)) {}

  std::map<std::string, NpyArray> Run() {
    std::map<std::string, NpyArray> arrays;
    int result = unzGoToFirstFile(archive_.get());
    for (; result == UNZ_OK; result = unzGoToNextFile(archive_.get())) {
      if (arrays.size() == limits_.arrays) {
        throw base::InputError(path_ + ": more than " + std::to_string(limits_.arrays) + " arrays");
      }
      unz_file_info64 info;
      const std::string name = NextName(&info);
      const std::string location = path_ + ": " + name;
      if (!arrays.emplace(name, ParseNpy(Unpack(info, location), location)).second) {
        throw base::InputError(location + ": is there twice");
      }
    }
    if (result != UNZ_END_OF_LIST_OF_FILE) {
      throw base::InputError(path_ + ": the archive's list of files is damaged");
    }
    return arrays;
  }

 private:
  std::string NextName(unz_file_info64* info) {
    char text[256] = {};
    if (unzGetCurrentFileInfo64(archive_.get(), info, text, sizeof(text) - 1, nullptr, 0, nullptr,
                                0) != UNZ_OK) {
      throw base::InputError(path_ + ": the archive's list of files is damaged");
    }
    std::string name = Printable(text);
    if (name.size() <= kSuffixLength ||
        name.compare(name.size() - kSuffixLength, kSuffixLength, kSuffix) != 0) {
      throw base::InputError(path_ + ": holds '" + name + "', should hold names that end in .npy");
    }
    return name.substr(0, name.size() - kSuffixLength);
  }

  // The bytes of the current file, whose check sum must match.
  std::string Unpack(const unz_file_info64& info, const std::string& location) {
    if (info.uncompressed_size > limits_.file_bytes) {
      throw base::InputError(location + ": has " + std::to_string(info.uncompressed_size) +
                             " bytes, should have at most " + std::to_string(limits_.file_bytes));
    }
    const bool encrypted = (info.flag & 1) != 0;
    if (encrypted || (info.compression_method != 0 && info.compression_method != Z_DEFLATED)) {
      throw base::InputError(location +
                             ": is encrypted or packed by another method, should be stored or " +
                             "deflated");
    }
    std::string bytes(static_cast<size_t>(info.uncompressed_size), '\0');
    const int opened = unzOpenCurrentFile(archive_.get());
    const int got =
        unzReadCurrentFile(archive_.get(), bytes.data(), static_cast<unsigned>(bytes.size()));
    const int closed = unzCloseCurrentFile(archive_.get());
    if (opened != UNZ_OK || got < 0 || static_cast<size_t>(got) != bytes.size() ||
        closed != UNZ_OK) {
      throw base::InputError(location + ": damaged: can't be unpacked, or its check sum differs");
    }
    return bytes;
  }

  const std::string& path_;
  const NpzLimits& limits_;
  Archive archive_;
};

// A file in memory, as the archive's library writes it.
struct MemoryFile {
  std::string bytes;
  size_t offset = 0;
};

MemoryFile* AsMemoryFile(void* stream) { return static_cast<MemoryFile*>(stream); }

uLong WriteToMemory(void*, void* stream, const void* bytes, uLong size) {
  MemoryFile* const file = AsMemoryFile(stream);
  if (file->bytes.size() < file->offset + size) file->bytes.resize(file->offset + size);
  file->bytes.replace(file->offset, size, static_cast<const char*>(bytes), size);
  file->offset += size;
  return size;
}

long SeekInMemory(void*, void* stream, ZPOS64_T offset, int origin) {
  MemoryFile* const file = AsMemoryFile(stream);
  const size_t start = origin == ZLIB_FILEFUNC_SEEK_SET   ? 0
                       : origin == ZLIB_FILEFUNC_SEEK_CUR ? file->offset
                                                          : file->bytes.size();
  file->offset = start + static_cast<size_t>(offset);
  return 0;
}

// The library's functions on a MemoryFile, with which an archive is written but not read.
zlib_filefunc64_def FunctionsOf(MemoryFile* file) {
  zlib_filefunc64_def functions = {};
  functions.opaque = file;
  functions.zopen64_file = [](void* opaque, const void*, int) { return opaque; };
  functions.zread_file = [](void*, void*, void*, uLong) { return uLong{0}; };
  functions.zwrite_file = WriteToMemory;
  functions.ztell64_file = [](void*, void* stream) {
    return static_cast<ZPOS64_T>(AsMemoryFile(stream)->offset);
  };
  functions.zseek64_file = SeekInMemory;
  functions.zclose_file = [](void*, void*) { return 0; };
  functions.zerror_file = [](void*, void*) { return 0; };
  return functions;
}

bool Add(zipFile archive, const std::string& name, const std::string& bytes) {
  zip_fileinfo info = {};
  info.dosDate = kFirstOfJanuary1980;
  return zipOpenNewFileInZip(archive, name.c_str(), &info, nullptr, 0, nullptr, 0, nullptr,
                             /*method: stored*/ 0, /*level*/ 0) == ZIP_OK &&
         zipWriteInFileInZip(archive, bytes.data(), static_cast<unsigned>(bytes.size())) ==
             ZIP_OK &&
         zipCloseFileInZip(archive) == ZIP_OK;
}

}  // namespace

std::map<std::string, NpyArray> ReadNpz(const std::string& path, const NpzLimits& limits) {
  return NpzReader(path, limits).Run();
}

std::string NpzBytes(const std::vector<std::pair<std::string, NpyArray>>& arrays) {
  MemoryFile file;
  zlib_filefunc64_def functions = FunctionsOf(&file);
  zipFile archive = zipOpen2_64("", APPEND_STATUS_CREATE, nullptr, &functions);
  bool complete = archive != nullptr;
  for (const auto& [name, array] : arrays) {
    complete = complete && Add(archive, name + kSuffix, NpyBytes(array));
  }
  // Closing writes the list of files.
  complete = archive != nullptr && zipClose(archive, nullptr) == ZIP_OK && complete;
  if (!complete) throw std::bad_alloc();  // the only way in which memory fails
  return std::move(file.bytes);
}

}  // namespace qz::arrays
