#include "LocalizerImpl/ReachStates.h"

#include <algorithm>
#include <new>

namespace
{

constexpr unsigned AT_START = 1; // offset 0

} // namespace

CReachStates::CReachStates(CPieceTable& table, bool bAnywhere)
    : m_table(table), m_bAnywhere(bAnywhere), m_iKeys(table.KeyCount()),
      m_iLimit(std::clamp(MOST_STEPS / m_iKeys, FEWEST_STATES, MOST_STATES)),
      m_pNext(new (std::nothrow) uint8_t[static_cast<size_t>(m_iLimit * m_iKeys)])
{
    if (m_pNext != nullptr)
    {
        for (const int iState : {ACCEPTED, REFUSED, UNKNOWN})
        {
            std::fill_n(StepOf(iState, 0), m_iKeys, static_cast<uint8_t>(iState));
        }
        ForgetStates();
    }
}

// Follows a longer name from the state that its first characters lead to, or, when a step was
// missing there, a name from its beginning.
bool CReachStates::GoOn(const wchar_t* pCodes, int iState)
{
    int i = iState == UNKNOWN ? 0 : AT_ONCE;
    for (iState = iState == UNKNOWN ? START : iState; i < CONTACT_MAX_KEY && iState > REFUSED; ++i)
    {
        const int iKey = m_table.KeyOf(pCodes[i]);
        const int iNext = *StepOf(iState, iKey);
        iState = iNext != UNKNOWN ? iNext : Step(iState, iKey);
    }
    return iState == ACCEPTED;
}

int CReachStates::Step(int iState, int iKey)
{
    const unsigned uReached = ReachedBehind(iState, iKey);
    int iNext = (uReached >> m_table.InputLength()) != 0 ? ACCEPTED : StateOf(uReached);
    if (iNext == UNKNOWN && m_iStates == m_iLimit)
    {
        ForgetStates(); // among them the one that the step begins in
        return AddState(uReached);
    }
    iNext = iNext == UNKNOWN ? AddState(uReached) : iNext;
    *StepOf(iState, iKey) = static_cast<uint8_t>(iNext);
    return iNext;
}

unsigned CReachStates::ReachedBehind(int iState, int iKey)
{
    unsigned uReached = m_bAnywhere ? AT_START : 0;
    for (unsigned uOffsets = m_auReached[iState]; uOffsets != 0; uOffsets &= uOffsets - 1)
    {
        uReached |= m_table.Ends(iKey, __builtin_ctz(uOffsets));
    }
    return uReached;
}

// The state of these offsets, UNKNOWN when there is none yet.
int CReachStates::StateOf(unsigned uReached) const
{
    const unsigned* pEnd = m_auReached + m_iStates;
    const unsigned* pFound = std::find(m_auReached + START, pEnd, uReached);
    return pFound != pEnd ? static_cast<int>(pFound - m_auReached) : UNKNOWN;
}

int CReachStates::AddState(unsigned uReached)
{
    m_auReached[m_iStates] = uReached;
    std::fill_n(StepOf(m_iStates, 0), m_iKeys, static_cast<uint8_t>(UNKNOWN));
    *StepOf(m_iStates, m_table.Sets().EndKey()) = REFUSED;
    return m_iStates++;
}

void CReachStates::ForgetStates()
{
    m_iStates = START;
    AddState(AT_START);
}
