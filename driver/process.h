#pragma once

// Prepares the process for a run at boot. To be called once, before anything else. Afterwards
//   - output that can't be delivered is lost: a pipe without a reader and a limit on file sizes
//     make a write fail instead of ending the run by SIGPIPE or SIGXFSZ;
//   - an exception that nobody catches ends the process with status 1, at once and silently.
// Prints nothing and throws nothing.
void prepare_process() noexcept;
