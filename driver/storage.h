#pragma once

// Puts the program's own directory and that of the downloads into data protection class D, so that
// they can be used before the device is first unlocked. Directories that can't be opened are
// skipped, and those that are missing aren't made.
// Where one is a link, the directory that it leads to gets the class.
// Prints nothing and throws nothing.
void prepare_storage() noexcept;
