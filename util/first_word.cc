#include "util/first_word.h"

#include <sys/stat.h>

#include <fstream>

std::string read_first_word(const std::string& path) {
  std::string word;
  struct stat status;
  if (stat(path.c_str(), &status) != 0 || !S_ISREG(status.st_mode)) return word;
  std::ifstream file(path);
  // A read error can cut a word short; what is left is not the word.
  if (!(file >> word)) word.clear();
  return word;
}
