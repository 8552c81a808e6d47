#pragma once

// Makes sure that the text of the local time link begins with the path of the zoneinfo link. A link
// for which it does is kept, whatever follows. One of the older form begins with the path of a tree
// in the system partition. There that path is replaced by the link's, if what the new text names
// exists. Anything else is replaced by a link to America/Los_Angeles.
// To be called once the zoneinfo link is settled.
// Prints, besides the primitives' lines,
//   "Correcting localtime link to TARGET"
//   "localtime link invalid; resetting to ZONE"
// Throws filesystem_error when the link to the default zone can't be made.
void repair_localtime_link();
