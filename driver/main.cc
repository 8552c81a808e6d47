#include "driver/legacy_icu.h"
#include "driver/localtime.h"
#include "driver/process.h"
#include "driver/selection.h"
#include "driver/storage.h"

// One run. A step that fails doesn't keep the next one from running, unless an exception escapes
// it: that ends the run with status 1.
int main() {
  prepare_process();
  prepare_storage();
  migrate_legacy_icu_link();
  remove_legacy_icu_entry();
  select_and_install();
  repair_localtime_link();
  return 0;
}
