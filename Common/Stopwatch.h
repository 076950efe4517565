#ifndef QV_COMMON_STOPWATCH_H
#define QV_COMMON_STOPWATCH_H

#include "Common/SystemTime.h"

// Milliseconds since it was made, for the log's time lines.
class CStopwatch
{
public:
    int Elapsed() const
    {
        return static_cast<int>(static_cast<uint32_t>(GetTickCount()) -
                                static_cast<uint32_t>(m_iStart));
    }

private:
    int32_t m_iStart = GetTickCount();
};

#endif
