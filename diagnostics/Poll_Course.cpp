#include "diagnostics/Poll_Course.h"

#include "foundation/management_api.h"

namespace cimple {

Poll_Course::Next Poll_Course::answered(uint32 status, uint32 state)
{
    const bool isRunning = state == RM_DIAG_PENDING || state == RM_DIAG_RUNNING;
    if (status == RM_STATUS_OK && !isRunning) return state == RM_DIAG_COMPLETED ? Next::finished : Next::failed;
    if (status != RM_STATUS_OK && status != RM_STATUS_NO_RESULT_YET) return Next::failed;
    if (isRunning && m_counter == 1) return Next::cancel;
    if (m_counter == 0) return Next::failed;
    m_counter--;
    return Next::poll;
}

Poll_Course::Next Poll_Course::cancelled(uint32 status)
{
    if (status == RM_STATUS_OK) return Next::failed;
    m_counter = 0;
    return Next::poll;
}

} // namespace cimple
