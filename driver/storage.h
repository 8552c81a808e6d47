#pragma once

// Puts the program's two directories into data protection class D, so that they can be used before
// the device is first unlocked. One that can't be opened is passed over.
// Prints nothing and raises nothing but lack of memory.
void prepare_storage();
