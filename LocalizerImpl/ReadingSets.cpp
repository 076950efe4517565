#include "LocalizerImpl/ReadingSets.h"

#include <cstring>
#include <new>

namespace
{

constexpr size_t READINGS_OFFSET = offsetof(PYOFWORDS, szPinyin);
constexpr size_t READINGS_SIZE = sizeof(PYOFWORDS) - READINGS_OFFSET;

constexpr int SLOT_BITS = 15;
constexpr uint32_t SLOT_COUNT = 1U << SLOT_BITS;
static_assert(SLOT_COUNT > 2 * PY_WORD_COUNT, "slots stay half empty");
constexpr uint64_t HASH_FACTOR = 0x9E3779B97F4A7C15ULL; // 2^64 divided by the golden ratio
constexpr int HASH_FOLD = 32;
constexpr int HASH_SHIFT = 64 - SLOT_BITS;

const char* ReadingsOf(const PYOFWORDS& record)
{
    return reinterpret_cast<const char*>(&record) + READINGS_OFFSET;
}

uint32_t SlotOf(const char* pReadings)
{
    uint64_t uHash = 0;
    for (size_t i = 0; i < READINGS_SIZE; i += sizeof(uint64_t))
    {
        uint64_t uBytes = 0;
        std::memcpy(&uBytes, pReadings + i,
                    i + sizeof(uBytes) <= READINGS_SIZE ? sizeof(uBytes) : READINGS_SIZE - i);
        uHash = (uHash ^ uBytes) * HASH_FACTOR;
        uHash ^= uHash >> HASH_FOLD;
    }
    return static_cast<uint32_t>((uHash * HASH_FACTOR) >> HASH_SHIFT);
}

// Numbers the different readings in the order in which they are met.
class CReadingIndex
{
public:
    explicit CReadingIndex(const PYOFWORDS* pMap)
        : m_pMap(pMap), m_pSlots(new (std::nothrow) uint16_t[SLOT_COUNT]()),
          m_pFirstOf(new (std::nothrow) uint16_t[PY_WORD_COUNT])
    {
    }

    bool IsReady() const { return m_pSlots != nullptr && m_pFirstOf != nullptr; }
    int Count() const { return m_iCount; }
    // The record that a set was first met in.
    const PYOFWORDS& FirstOf(int iSet) const { return m_pMap[m_pFirstOf.get()[iSet]]; }

    int Number(int iRecord)
    {
        const char* pReadings = ReadingsOf(m_pMap[iRecord]);
        uint32_t uSlot = SlotOf(pReadings);
        while (m_pSlots[uSlot] != EMPTY)
        {
            const int iSet = m_pSlots[uSlot] - 1;
            if (std::memcmp(ReadingsOf(FirstOf(iSet)), pReadings, READINGS_SIZE) == 0)
            {
                return iSet;
            }
            uSlot = (uSlot + 1) % SLOT_COUNT;
        }
        m_pFirstOf.get()[m_iCount] = static_cast<uint16_t>(iRecord);
        m_pSlots[uSlot] = static_cast<uint16_t>(m_iCount + 1);
        return m_iCount++;
    }

private:
    static constexpr uint16_t EMPTY = 0;

    const PYOFWORDS* m_pMap;
    std::unique_ptr<uint16_t[]> m_pSlots; // set + 1, or EMPTY
    std::unique_ptr<uint16_t[]> m_pFirstOf;
    int m_iCount = 0;
};

} // namespace

// The sets that the process keeps from one search to the next. A search takes them out of their
// place and puts them back, so it never waits; one that finds the place empty makes sets of its
// own, which is cheap. Kept as long as the process lives, since threads may search while it exits.
struct tag_KeptSets
{
    CReadingSets::Ptr sets;
    tag_FileStamp stamp;
};

namespace
{

std::atomic<tag_KeptSets*> g_pKept(nullptr);

void PutKept(tag_KeptSets* pKept)
{
    delete g_pKept.exchange(pKept);
}

} // namespace

CReadingSets::Ptr CReadingSets::Lend(const tag_FileStamp& stamp)
{
    tag_KeptSets* pKept = g_pKept.exchange(nullptr);
    if (pKept == nullptr)
    {
        return nullptr;
    }
    Ptr sets = IsSameStamp(stamp, pKept->stamp) ? pKept->sets->Share() : nullptr;
    PutKept(pKept);
    return sets;
}

void CReadingSets::Keep(const tag_FileStamp& stamp) const
{
    PutKept(new (std::nothrow) tag_KeptSets{Share(), stamp});
}

CReadingSets::Ptr CReadingSets::Of(const PYOFWORDS* pMap, const tag_FileStamp& stamp)
{
    Ptr pSets = Lend(stamp);
    if (pSets == nullptr)
    {
        pSets = Make(pMap);
        if (pSets != nullptr && stamp.bSettled)
        {
            pSets->Keep(stamp);
        }
    }
    return pSets;
}

void CReadingSets::tag_Release::operator()(const CReadingSets* pSets) const
{
    if (--pSets->m_iUsers == 0)
    {
        delete pSets;
    }
}

CReadingSets::Ptr CReadingSets::Share() const
{
    ++m_iUsers;
    return Ptr(this);
}

CReadingSets::Ptr CReadingSets::Make(const PYOFWORDS* pMap)
{
    CReadingSets* pSets = new (std::nothrow) CReadingSets;
    Ptr pOwner(pSets);
    return pSets != nullptr && pSets->Fill(pMap) ? std::move(pOwner) : nullptr;
}

bool CReadingSets::Fill(const PYOFWORDS* pMap)
{
    CReadingIndex index(pMap);
    m_pKeyOf.reset(new (std::nothrow) uint16_t[CODE_COUNT]);
    m_pWords.reset(new (std::nothrow) tag_Word[PY_WORD_COUNT]);
    if (!index.IsReady() || m_pKeyOf == nullptr || m_pWords == nullptr)
    {
        return false;
    }
    uint16_t* pKeys = m_pKeyOf.get() + LOC_HANZI_BASE;
    tag_Word* pWords = m_pWords.get();
    for (int i = 0; i < PY_WORD_COUNT; ++i)
    {
        pKeys[i] = static_cast<uint16_t>(index.Number(i));
        std::memcpy(pWords[i].szWord, pMap[i].szWord, sizeof(tag_Word));
    }
    m_iCount = index.Count();
    FillOtherKeys();
    m_pRecords.reset(new (std::nothrow) PYOFWORDS[static_cast<size_t>(m_iCount)]);
    if (m_pRecords == nullptr)
    {
        return false;
    }
    PYOFWORDS* pRecords = m_pRecords.get();
    for (int i = 0; i < m_iCount; ++i)
    {
        pRecords[i] = index.FirstOf(i);
        std::memset(pRecords[i].szWord, 0, sizeof(tag_Word));
    }
    return true;
}

void CReadingSets::FillOtherKeys()
{
    for (uint32_t uCode = 0; uCode < CODE_COUNT; ++uCode)
    {
        const uint16_t uBits = static_cast<uint16_t>(uCode);
        int iPlace = uCode == LOC_OTHER ? PLACE_OTHER : PLACE_UNKNOWN;
        if (IsAlphaCode(uBits))
        {
            iPlace = PLACE_ALPHA + static_cast<int>(uBits - LOC_ALPHA_BASE);
        }
        else if (IsDigitCode(uBits))
        {
            iPlace = PLACE_DIGIT + static_cast<int>(uBits - LOC_DIGIT_BASE);
        }
        if (!IsHanZiCode(uBits))
        {
            m_pKeyOf[uCode] = static_cast<uint16_t>(m_iCount + iPlace);
        }
    }
    m_pKeyOf[LOC_NO_CODE] = static_cast<uint16_t>(EndKey());
}

// Codes of which only the low 16 bits are sound. They act by these, except that LOC_OTHER and
// LOC_NO_CODE with upper bits are neither a key to type nor the end of a name.
int CReadingSets::KeyOfWide(wchar_t code) const
{
    const uint16_t uCode = CodeBits(code);
    if (uCode == LOC_OTHER)
    {
        return m_iCount + PLACE_WIDE_OTHER;
    }
    return uCode != LOC_NO_CODE && uCode < CODE_COUNT ? m_pKeyOf[uCode] : m_iCount + PLACE_UNKNOWN;
}

namespace
{

constexpr wchar_t LOC_WIDE_OTHER = LOC_OTHER | 0x10000; // any such code

wchar_t CodeAt(wchar_t base, int iPlace)
{
    return static_cast<wchar_t>(static_cast<int>(base) + iPlace);
}

} // namespace

tag_KeyMeaning CReadingSets::MeaningOf(int iKey) const
{
    const int iPlace = iKey - m_iCount;
    if (iPlace < PLACE_ALPHA)
    {
        return {LOC_HANZI_BASE, Records() + iKey};
    }
    if (iPlace < PLACE_DIGIT)
    {
        return {CodeAt(LOC_ALPHA_BASE, iPlace), nullptr};
    }
    if (iPlace < PLACE_OTHER)
    {
        return {CodeAt(LOC_DIGIT_BASE, iPlace - PLACE_DIGIT), nullptr};
    }
    constexpr wchar_t OTHERS[] = {LOC_OTHER, LOC_WIDE_OTHER, LOC_NO_CODE, LOC_NO_CODE};
    static_assert(sizeof(OTHERS) / sizeof(*OTHERS) == PLACE_COUNT - PLACE_OTHER, "a code a place");
    return {OTHERS[iPlace - PLACE_OTHER], nullptr};
}

PYOFWORDS CReadingSets::RecordOf(wchar_t code) const
{
    PYOFWORDS record = Records()[KeyOf(CodeBits(code))];
    std::memcpy(record.szWord, m_pWords.get()[HanZiRecord(code)].szWord, sizeof(tag_Word));
    return record;
}
