#include "simulator/Names.h"

namespace nvrsim {

Names lasting_names(const Port& port)
{
    return port.nonVolatile.value_or(port.factory);
}

void activate_names(Adapter& adapter, Port& port)
{
    if (!port.pending) return;
    if (port.pending->isVolatile)
        port.volatileNames = port.pending->names;
    else
        port.nonVolatile = port.pending->names;
    if (port.pending->dropVolatile) port.volatileNames.reset();
    port.current = port.volatileNames.value_or(lasting_names(port));
    port.pending.reset();
    if (port.index == 0) adapter.nodeWwn = port.current.wwnn;
}

} // namespace nvrsim
