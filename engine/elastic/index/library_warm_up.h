#pragma once

namespace vantrel::elastic {

// Makes the index library set up what it sets up on first use, without a lock: shared defaults, tables and the
// like. To be called before two threads may be in the library at once; calling it again does nothing, and
// waits for a first call that is under way.
void WarmUpIndexLibrary();

}  // namespace vantrel::elastic
