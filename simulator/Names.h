// Names of local ports that wait for their activation. With the simulator's lock held.
#ifndef _simulator_Names_h
#define _simulator_Names_h

#include "simulator/Model.h"

namespace nvrsim {

/// The names that a port has without volatile ones.
Names lasting_names(const Port& port);
/// What waited becomes the port's own. The caller reindexes the host.
void activate_names(Adapter& adapter, Port& port);

} // namespace nvrsim

#endif // _simulator_Names_h
