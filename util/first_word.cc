#include "util/first_word.h"

#include <sys/stat.h>

#include <fstream>

namespace {

constexpr off_t largest_size = 16 << 20;  // in bytes

// Whether a stream can be trusted to reach the end of the file at `path`.
bool is_readable_to_its_end(const std::string& path) {
  struct stat status;
  return stat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode) && status.st_size > 0 &&
         status.st_size <= largest_size;
}

}  // namespace

std::string read_first_word(const std::string& path) {
  std::string word;
  if (!is_readable_to_its_end(path)) return word;
  std::ifstream file(path);
  // A read error can cut a word short; what is left is not the word.
  if (!(file >> word)) word.clear();
  return word;
}
