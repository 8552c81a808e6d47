#include "driver/legacy_icu.h"
#include "driver/localtime.h"
#include "driver/selection.h"
#include "driver/storage.h"
#include "platform/process.h"

// One run. Each step reports its own failures and lets the next ones run; an error that a step has
// no answer to ends the run there with status 1.
int main() {
  prepare_process();
  prepare_storage();
  migrate_legacy_icu_link();
  remove_legacy_icu_entry();
  select_and_install();
  repair_localtime_link();
  return 0;
}
