#include "tools/IndexWatch.h"

#include "Common/DataPaths.h"

#include <algorithm>
#include <ctime>
#include <sys/stat.h>

namespace
{

constexpr int64_t NS_PER_SECOND = 1000000000;
// The coarsest step of a file system's clock.
constexpr int64_t YOUNG_NS = 2 * NS_PER_SECOND;

int64_t Nanoseconds(const timespec& time)
{
    return int64_t{time.tv_sec} * NS_PER_SECOND + time.tv_nsec;
}

} // namespace

bool CIndexWatch::tag_FileState::operator==(const tag_FileState& other) const
{
    return uDevice == other.uDevice && uNumber == other.uNumber && llSize == other.llSize &&
           llTime == other.llTime;
}

void CIndexWatch::Note()
{
    m_states = ReadStates();
    m_bYoung = IsYoung(m_states);
}

bool CIndexWatch::Changed() const
{
    const States states = ReadStates();
    return states != m_states || (m_bYoung && !IsYoung(states));
}

CIndexWatch::tag_FileState CIndexWatch::StateOf(const char* szPath)
{
    struct stat info = {};
    if (stat(szPath, &info) != 0)
    {
        return {};
    }
    return {static_cast<uint64_t>(info.st_dev), static_cast<uint64_t>(info.st_ino),
            static_cast<int64_t>(info.st_size), Nanoseconds(info.st_mtim)};
}

CIndexWatch::States CIndexWatch::ReadStates()
{
    return {StateOf(CDataPaths::ContactReg()), StateOf(CDataPaths::ContactRecords())};
}

// A time in the future, after the clock was set back, counts as aged.
bool CIndexWatch::IsYoung(const States& states)
{
    timespec now = {};
    clock_gettime(CLOCK_REALTIME, &now);
    return std::any_of(states.begin(), states.end(),
                       [&now](const tag_FileState& state)
                       {
                           const int64_t llAge = Nanoseconds(now) - state.llTime;
                           return llAge >= 0 && llAge < YOUNG_NS;
                       });
}
