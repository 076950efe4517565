#ifndef QV_LOCALIZERIMPL_FIRSTFOUND_H
#define QV_LOCALIZERIMPL_FIRSTFOUND_H

#include "LocalizerImpl/PinyinTable.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "LocalizerImpl/ReadingSets.h"

#include <algorithm>
#include <cstdint>

// The Chinese characters that took a last piece first, in the order in which trying split by split
// and candidate by candidate would have met them: as many as a search reports.
class CFirstFound
{
public:
    struct tag_Find
    {
        uint64_t uWhen; // split above, candidate below
        wchar_t code;
        wchar_t character;

        uint32_t Split() const { return static_cast<uint32_t>(uWhen >> CANDIDATE_BITS); }
    };

    // Whether a find at this time could still be among the first.
    bool IsEarly(uint32_t uSplit, int32_t iCandidate) const
    {
        return m_iCount < CN_WORD_MAX || When(uSplit, iCandidate) < m_aFinds[m_iCount - 1].uWhen;
    }

    void Add(uint32_t uSplit, int32_t iCandidate, wchar_t code, const CReadingSets& sets)
    {
        tag_Find find = {When(uSplit, iCandidate), code, 0};
        tag_Find* pEnd = m_aFinds + m_iCount;
        tag_Find* pSame = std::find_if(
            m_aFinds, pEnd, [code](const tag_Find& earlier) { return earlier.code == code; });
        find.character = pSame != pEnd ? pSame->character : RecordCharacter(sets.RecordOf(code));
        if (find.character == 0)
        {
            return; // only in a damaged table
        }
        if (pSame == pEnd)
        {
            pSame = std::find_if(m_aFinds, pEnd,
                                 [&find](const tag_Find& earlier)
                                 { return earlier.character == find.character; });
        }
        Place(find, pSame);
    }

    int Count() const { return m_iCount; }
    const tag_Find& At(int i) const { return m_aFinds[i]; }

private:
    static constexpr int CANDIDATE_BITS = 32;

    static uint64_t When(uint32_t uSplit, int32_t iCandidate)
    {
        return (static_cast<uint64_t>(uSplit) << CANDIDATE_BITS) |
               static_cast<uint32_t>(iCandidate);
    }

    // pSame is the find of the same character, or the end.
    void Place(const tag_Find& find, tag_Find* pSame)
    {
        tag_Find* pEnd = m_aFinds + m_iCount;
        tag_Find* pPlace =
            std::find_if(m_aFinds, pEnd,
                         [&find](const tag_Find& earlier) { return find.uWhen < earlier.uWhen; });
        if (pPlace > pSame || pPlace == m_aFinds + CN_WORD_MAX)
        {
            return; // it was found no later, or is too late
        }
        if (pSame == pEnd)
        {
            // One more, or in place of the latest.
            m_iCount = std::min(m_iCount + 1, CN_WORD_MAX);
            pSame = m_aFinds + m_iCount - 1;
        }
        std::move_backward(pPlace, pSame, pSame + 1);
        *pPlace = find;
    }

    tag_Find m_aFinds[CN_WORD_MAX] = {};
    int m_iCount = 0;
};

#endif
