#include "driver/record.h"

#include <fstream>

#include "driver/paths.h"
#include "util/regular_file.h"

void write_record(const std::string& from, const std::string& to) {
  if (!is_regular_or_absent(paths::record)) return;
  std::ofstream(paths::record) << from << '_' << to;
}
