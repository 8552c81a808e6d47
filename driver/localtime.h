#pragma once

// Sees to it that the local time link leads through the zoneinfo link. One that does is left alone,
// whatever its zone; one of the older form, straight into the system partition, is rewritten to the
// same zone if the active data has it; anything else is replaced by a link to America/Los_Angeles.
// To be called when the zoneinfo link is settled.
// Prints, besides the primitives' lines,
//   "Correcting localtime link to TARGET"
//   "localtime link invalid; resetting to ZONE"
// Raises filesystem_error when the link to the default zone can't be made.
void repair_localtime_link();
