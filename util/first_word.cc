#include "util/first_word.h"

#include <sys/stat.h>

#include <cstdint>
#include <ctime>
#include <fstream>
#include <iomanip>

namespace {

constexpr off_t largest_size = 16 << 20;  // in bytes

// Narrower, and stat(2) and fts(3) refuse a file of more than 2 GiB or dated past 2038.
static_assert(sizeof(off_t) >= sizeof(std::int64_t) && sizeof(std::time_t) >= sizeof(std::int64_t),
              "build with -D_FILE_OFFSET_BITS=64 and -D_TIME_BITS=64");

}  // namespace

std::string read_first_word(const std::string& path) {
  std::string word;
  struct stat status;
  if (stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode) || status.st_size < 1 ||
      status.st_size > largest_size) {
    return word;
  }
  // Room for the longest word: one that grows takes up to four times its size.
  word.reserve(static_cast<std::size_t>(status.st_size));
  std::ifstream file(path);
  // A larger file may stand at the path by now.
  file >> std::setw(static_cast<int>(status.st_size)) >> word;
  // A read error can cut a word short; what is left is not the word.
  if (!file) word.clear();
  return word;
}
