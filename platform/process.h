#pragma once

// Makes the process fit for a run at boot. Called once, before all else. Afterwards
//   - a warning that goes to a pipe without a reader is lost, instead of ending the run by SIGPIPE;
//   - an error that nobody catches ends the process with status 1, at once and without a line.
// Prints nothing and raises nothing.
void prepare_process() noexcept;
