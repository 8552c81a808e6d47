#include "util/first_word.h"

#include <fstream>

#include "util/openable.h"

std::string first_word(const std::string& path) {
  std::string word;
  if (!openable(path)) return word;
  std::ifstream file(path);
  // A word that a read error cut short is no word.
  if (!(file >> word)) word.clear();
  return word;
}
