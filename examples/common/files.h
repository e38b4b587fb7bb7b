// Reading and writing whole files. A file is written under a temporary name and then renamed: whoever
// looks sees the old file, the new one or none, never a part of one.
#ifndef KASTARRI_EXAMPLES_FILES_H
#define KASTARRI_EXAMPLES_FILES_H

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <sys/stat.h>
#include <unistd.h>

#include "common/failure.h"

namespace examples {

using Bytes = std::vector<std::uint8_t>;

inline Bytes read_file(const std::string& path) {
  std::FILE* file = std::fopen(path.c_str(), "rb");
  if (!file) throw Failure(path + ": " + std::strerror(errno));
  Bytes bytes;
  std::uint8_t block[65536];
  while (const std::size_t got = std::fread(block, 1, sizeof block, file))
    bytes.insert(bytes.end(), block, block + got);
  const bool failed = std::ferror(file) != 0;
  const int reason = errno;
  std::fclose(file);
  if (failed) throw Failure(path + ": " + std::strerror(reason));
  return bytes;
}

inline void write_file(const std::string& path, const void* data, std::size_t size) {
  // A device or a pipe is written to as it is: a rename would put a file in its place.
  struct stat status;
  const bool special = ::stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode);
  const std::string temporary = special ? path : path + "." + std::to_string(::getpid()) + ".tmp";
  std::FILE* file = std::fopen(temporary.c_str(), "wb");
  if (!file) throw Failure(path + ": " + std::strerror(errno));
  bool written = std::fwrite(data, 1, size, file) == size;
  written = std::fclose(file) == 0 && written;
  if (written && (special || std::rename(temporary.c_str(), path.c_str()) == 0)) return;
  const int reason = errno;
  if (!special) std::remove(temporary.c_str());
  throw Failure(path + ": cannot be written: " + std::strerror(reason));
}
inline void write_file(const std::string& path, const std::string& text) { write_file(path, text.data(), text.size()); }
inline void write_file(const std::string& path, const Bytes& bytes) { write_file(path, bytes.data(), bytes.size()); }

}  // namespace examples

#endif
