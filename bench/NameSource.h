#ifndef QV_BENCH_NAMESOURCE_H
#define QV_BENCH_NAMESOURCE_H

#include <cstdint>
#include <string>

// Names as they stand in a large Chinese address book, the same sequence for the same seed: about
// 80 % personal names with surnames in their real proportions, the rest Latin names, names that
// mix both, and companies.
class CNameSource
{
public:
    explicit CNameSource(uint64_t uSeed) : m_uState(uSeed) {}

    std::wstring Next();
    // A personal name with this surname.
    std::wstring NextOf(wchar_t surname);

private:
    uint32_t Below(uint32_t uLimit);
    wchar_t Surname();
    wchar_t Pick(const wchar_t* szCharacters, uint32_t uCount);
    std::wstring LatinName();
    std::wstring CompanyName();

    uint64_t m_uState;
};

#endif
