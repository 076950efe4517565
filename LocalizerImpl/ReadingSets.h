#ifndef QV_LOCALIZERIMPL_READINGSETS_H
#define QV_LOCALIZERIMPL_READINGSETS_H

// The pinyin table without its repetitions.
//
// 15,422 characters share about a thousand sets of readings, and what a typed piece does on a
// character depends on its set alone. So every code has a key: characters with the same readings
// share one, letters, digits and the rest have theirs behind.

#include "Core/Records/LocalizerCodes.h"
#include "LocalizerImpl/FileStamp.h"

#include <atomic>
#include <cstdint>
#include <memory>

// What the characters of a key are.
struct tag_KeyMeaning
{
    wchar_t code;       // theirs; for Chinese characters any Chinese code
    PYOFWORDS* pRecord; // the readings of Chinese characters, without a character; null for others
};

class CReadingSets
{
public:
    struct tag_Release
    {
        void operator()(const CReadingSets* pSets) const;
    };
    using Ptr = std::unique_ptr<const CReadingSets, tag_Release>;

    // The sets of a mapped table whose stamp was read before it was mapped; null if the
    // allocation fails. They are a copy: no mapping is kept. The process keeps the last ones whose
    // stamp was settled, about 150 KB, and gives them out again as long as the stamp is the same,
    // so that a keystroke does not go through the table's 170 pages again. Any thread may call.
    static Ptr Of(const PYOFWORDS* pMap, const tag_FileStamp& stamp);

    CReadingSets(const CReadingSets&) = delete;
    CReadingSets& operator=(const CReadingSets&) = delete;

    int Count() const { return m_iCount; }
    // By set; their characters are empty. Shared by all searches: to be read only.
    PYOFWORDS* Records() const { return m_pRecords.get(); }

    // Keys are 0..KeyCount() - 1, first one for each set. A code acts by its low 16 bits, except
    // that LOC_OTHER and LOC_NO_CODE have other keys with upper bits set, which only a damaged
    // record holds.
    int KeyCount() const { return m_iCount + PLACE_COUNT; }
    int KeyOf(wchar_t code) const
    {
        const uint32_t uCode = static_cast<uint32_t>(code);
        return uCode < CODE_COUNT ? m_pKeyOf[uCode] : KeyOfWide(code);
    }
    // The keys of the codes below CODE_COUNT, which are all that sound records hold.
    const uint16_t* Keys() const { return m_pKeyOf.get(); }
    // Up to the last code of all.
    static constexpr uint32_t CODE_COUNT = LOC_DIGIT_BASE + LOC_DIGIT_COUNT;
    tag_KeyMeaning MeaningOf(int iKey) const;
    // The key of LOC_NO_CODE, which no other code has.
    int EndKey() const { return m_iCount + PLACE_END; }

    // The record of a Chinese code as the pinyin table has it.
    PYOFWORDS RecordOf(wchar_t code) const;

private:
    // The keys behind the sets.
    static constexpr int PLACE_ALPHA = 0;
    static constexpr int PLACE_DIGIT = PLACE_ALPHA + LOC_ALPHA_COUNT;
    static constexpr int PLACE_OTHER = PLACE_DIGIT + LOC_DIGIT_COUNT;
    static constexpr int PLACE_WIDE_OTHER = PLACE_OTHER + 1;
    static constexpr int PLACE_UNKNOWN = PLACE_OTHER + 2;
    static constexpr int PLACE_END = PLACE_OTHER + 3; // of LOC_NO_CODE alone
    static constexpr int PLACE_COUNT = PLACE_OTHER + 4;

    struct tag_Word
    {
        char szWord[sizeof(PYOFWORDS::szWord)];
    };

    CReadingSets() = default;
    ~CReadingSets() = default;
    static Ptr Make(const PYOFWORDS* pMap);
    bool Fill(const PYOFWORDS* pMap);
    void FillOtherKeys();
    int KeyOfWide(wchar_t code) const;
    Ptr Share() const;
    static Ptr Lend(const tag_FileStamp& stamp);
    void Keep(const tag_FileStamp& stamp) const;

    int m_iCount = 0;
    std::unique_ptr<uint16_t[]> m_pKeyOf; // by code
    std::unique_ptr<tag_Word[]> m_pWords; // by record of the pinyin table
    std::unique_ptr<PYOFWORDS[]> m_pRecords;
    mutable std::atomic<int> m_iUsers{1};
};

#endif
