#include "driver/record.h"

#include <fstream>

#include "driver/paths.h"
#include "util/openable.h"

void write_record(const std::string& from, const std::string& to) {
  if (!openable(paths::record)) return;
  std::ofstream(paths::record, std::ios::trunc) << from << '_' << to;
}
