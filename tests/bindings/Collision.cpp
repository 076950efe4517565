// A process with another library that has some of the names of the portability layer, _wcslen for
// 16-bit characters among them. Ends with 0 when both libraries get their own.
//
// Collision DATA_DIRECTORY, which holds an index.

#include "bindings/c/qvlocalize.h"

#include <cstdio>
#include <cstdlib>
#include <string>

extern "C"
{
    // Of libwinpr2, whose headers are in another package. Up to the terminator for a length of -1;
    // *pszTarget is allocated when it is null.
    int ConvertFromUnicode(unsigned uCodePage, unsigned uFlags, const char16_t* szSource,
                           int iUnits, char** pszTarget, int iBytes, const char* szDefault,
                           int* pbDefaultUsed);
    int _wcscmp(const char16_t* szLeft, const char16_t* szRight);
}

namespace
{

constexpr unsigned CODE_PAGE_UTF8 = 65001;

// Texts that come out wrong when their length or order is that of 32-bit units: an even number of
// units with zeros behind them, and letters whose order pairs of them reverse.
bool ConvertsText()
{
    constexpr char16_t TEXT[16] = u"contact \u5F20!";
    constexpr char16_t LESS[4] = u"ab";
    constexpr char16_t GREATER[4] = u"ba";
    char* szText = nullptr;
    ConvertFromUnicode(CODE_PAGE_UTF8, 0, TEXT, -1, &szText, 0, nullptr, nullptr);
    const std::string strText = szText != nullptr ? szText : "";
    std::free(szText);
    return strText == "contact \u5F20!" && _wcscmp(LESS, GREATER) < 0;
}

bool FindsContacts(const char* szDirectory)
{
    qv_index* pIndex = nullptr;
    qv_result* pResult = nullptr;
    const qv_query query = {"zhangsan", QV_KIND_WORD, nullptr, 0};
    const bool bFound = qv_open(szDirectory, &pIndex) == QV_OK && qv_build(pIndex, 1) == QV_OK &&
                        qv_search(pIndex, &query, nullptr, &pResult) == QV_OK &&
                        qv_result_count(pResult) > 0;
    qv_result_free(pResult);
    qv_close(pIndex);
    return bFound;
}

} // namespace

int main(int argc, char** argv)
{
    const bool bBefore = ConvertsText();
    const bool bFound = argc > 1 && FindsContacts(argv[1]);
    const bool bAfter = ConvertsText();
    std::printf("converts before: %d, finds: %d, converts after: %d\n", bBefore, bFound, bAfter);
    return bBefore && bFound && bAfter ? 0 : 1;
}
