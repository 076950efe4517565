#ifndef QV_LOCALIZERIMPL_REACHSTATES_H
#define QV_LOCALIZERIMPL_REACHSTATES_H

#include "LocalizerImpl/PieceTable.h"

#include <cstdint>
#include <memory>

// Decides whether a typed text spells a run of a name: a lazily built DFA over sets of reachable
// offsets, for all starts and splits at once. A state is the set of offsets of the text that are
// reached behind a character; few sets ever occur, and a transition is computed when a name first
// takes it. The first four characters are followed without a branch that could be mispredicted.
class CReachStates
{
public:
    // bAnywhere false: runs begin at a name's first character only. The table outlives the object.
    CReachStates(CPieceTable& table, bool bAnywhere);
    CReachStates(const CReachStates&) = delete;
    CReachStates& operator=(const CReachStates&) = delete;

    // False if the allocation failed; then nothing else may be called.
    bool IsReady() const { return m_pNext != nullptr; }

    // pCodes: CONTACT_MAX_KEY codes, of which those from the first LOC_NO_CODE on do not count. The
    // text is not empty.
    bool Accept(const wchar_t* pCodes)
    {
        int iState = START;
        for (int i = 0; i < AT_ONCE; ++i)
        {
            iState = *StepOf(iState, m_table.KeyOf(pCodes[i]));
        }
        return iState <= REFUSED ? iState == ACCEPTED : GoOn(pCodes, iState);
    }

private:
    static constexpr int AT_ONCE = 4;
    static_assert(AT_ONCE <= CONTACT_MAX_KEY, "codes that are there");

    // The first states; from the first three there is no way on.
    static constexpr int ACCEPTED = 0;
    static constexpr int REFUSED = 1; // the name is over
    static constexpr int UNKNOWN = 2; // a transition not computed yet
    static constexpr int START = 3;
    static constexpr int FEWEST_STATES = START + 2; // the start and the one a step leads to
    static constexpr int MOST_STATES = 64;
    static constexpr int MOST_STEPS = 64 * 1024; // only a damaged table has many keys

    uint8_t* StepOf(int iState, int iKey) { return m_pNext.get() + (iState * m_iKeys + iKey); }
    bool GoOn(const wchar_t* pCodes, int iState);
    int Step(int iState, int iKey);
    unsigned ReachedBehind(int iState, int iKey);
    int StateOf(unsigned uReached) const;
    int AddState(unsigned uReached);
    void ForgetStates();

    CPieceTable& m_table;
    bool m_bAnywhere;
    int m_iKeys;
    int m_iLimit; // of states
    int m_iStates = 0;
    unsigned m_auReached[MOST_STATES] =
        {};                             // by state from START on: offsets where pieces may begin
    std::unique_ptr<uint8_t[]> m_pNext; // by state, then by key: the next state
};

#endif
