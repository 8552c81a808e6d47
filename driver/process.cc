#include "driver/process.h"

#include <csignal>
#include <cstdlib>
#include <exception>

void prepare_process() noexcept {
  (void)std::signal(SIGPIPE, SIG_IGN);
  (void)std::signal(SIGXFSZ, SIG_IGN);
  std::set_terminate([] { std::_Exit(EXIT_FAILURE); });
}
