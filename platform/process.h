#pragma once

// Makes the process fit for a run at boot, whatever it was started with. Called once, before all
// else. Afterwards
//   - a warning that goes to a pipe without a reader is lost, instead of ending the run by SIGPIPE;
//   - each standard descriptor that was closed is taken, so that no file opened later becomes
//     standard error and receives the warnings;
//   - an error that nobody catches ends the process with status 1, at once.
// Prints nothing and raises nothing.
void prepare_process() noexcept;
