#ifndef QV_LOCALIZERIMPL_READINGSETS_H
#define QV_LOCALIZERIMPL_READINGSETS_H

// The pinyin table without its repetitions.
//
// 15,422 characters share about a thousand sets of readings, and what a typed piece does on a
// character depends on its set alone. The sets form a table of their own, in which a character
// has a compact code: LOC_HANZI_BASE + its set. Whatever takes a table and a code takes this table
// and a compact code too.

#include "Common/FileStamp.h"
#include "Core/LocalizerCodes.h"

#include <atomic>
#include <cstdint>
#include <memory>

class CReadingSets
{
public:
    struct tag_Release
    {
        void operator()(const CReadingSets* pSets) const;
    };
    using Ptr = std::unique_ptr<const CReadingSets, tag_Release>;

    // The sets of a mapped table whose stamp was read before it was mapped; null for want of
    // memory. They are a copy: no mapping is kept. The process keeps the last ones, about 140 KB,
    // for as long as the stamp stays the same, so that a keystroke does not go through the
    // table's 170 pages again. Any thread may call.
    static Ptr Of(const PYOFWORDS* pMap, const tag_FileStamp& stamp);

    CReadingSets(const CReadingSets&) = delete;
    CReadingSets& operator=(const CReadingSets&) = delete;

    int Count() const { return m_iCount; }
    // By set; their characters are empty.
    PYOFWORDS* Records() const { return m_pRecords.get(); }

    // The set of a Chinese code.
    int SetOf(wchar_t code) const { return m_pSetOf[HanZiRecord(code)]; }
    // Any code as one for Records().
    wchar_t CompactCode(wchar_t code) const
    {
        return IsHanZiCode(CodeBits(code)) ? LOC_HANZI_BASE + SetOf(code) : code;
    }
    // The record of a Chinese code as the pinyin table has it.
    PYOFWORDS RecordOf(wchar_t code) const;

private:
    struct tag_Word
    {
        char szWord[sizeof(PYOFWORDS::szWord)];
    };

    friend class CKeptSets;

    CReadingSets() = default;
    ~CReadingSets() = default;
    static Ptr Make(const PYOFWORDS* pMap);
    bool Fill(const PYOFWORDS* pMap);
    Ptr Share() const;

    int m_iCount = 0;
    std::unique_ptr<uint16_t[]> m_pSetOf; // by record of the pinyin table
    std::unique_ptr<tag_Word[]> m_pWords; // the same
    std::unique_ptr<PYOFWORDS[]> m_pRecords;
    mutable std::atomic<int> m_iUsers{1};
};

#endif
