#include "util/regular_file.h"

#include <sys/stat.h>

#include <cerrno>
#include <fstream>

bool is_regular_or_absent(const std::string& path) noexcept {
  struct stat status;
  return stat(path.c_str(), &status) == 0 ? S_ISREG(status.st_mode) : errno == ENOENT;
}

std::string read_first_word(const std::string& path) {
  std::string word;
  if (!is_regular_or_absent(path)) return word;
  std::ifstream file(path);
  // A read error can cut a word short; what is left is not the word.
  if (!(file >> word)) word.clear();
  return word;
}
