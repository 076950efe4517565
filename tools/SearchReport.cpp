#include "tools/SearchReport.h"

#include "LocalizerImpl/QVNumLocalizerManager.h"
#include "tools/PrintableText.h"
#include "tools/Utf8Text.h"

namespace
{

constexpr uint32_t MATCH_START_SHIFT = 16;
constexpr uint32_t MATCH_END_MASK = 0xFFFF;

} // namespace

int FirstMatched(const tag_LocalizerDetail& detail)
{
    return static_cast<int>(static_cast<uint32_t>(detail.iMatchPos) >> MATCH_START_SHIFT);
}

int LastMatched(const tag_LocalizerDetail& detail)
{
    return static_cast<int>(static_cast<uint32_t>(detail.iMatchPos) & MATCH_END_MASK);
}

std::string MarkedName(const tag_FoundContact& contact, const tag_SearchStep& step,
                       const tag_Marking& marking)
{
    const bool bMark = !step.strTyped.empty();
    std::string strMarked;
    int iCharacter = 0; // a name has one code per character
    for (const std::string& strCharacter : Characters(contact.strName))
    {
        const bool bFirst = bMark && iCharacter == FirstMatched(contact.detail);
        const bool bLast = bMark && iCharacter == LastMatched(contact.detail);
        strMarked += bFirst ? marking.szBegin : "";
        strMarked += marking.bPrintable ? PrintableText(strCharacter) : strCharacter;
        strMarked += bLast ? marking.szEnd : "";
        ++iCharacter;
    }
    return strMarked;
}

std::vector<std::string> NextKeys(uint32_t uMask, bool bKeypad)
{
    CQVNumLocalizerManager keypad(1);
    std::vector<std::string> vKeys;
    for (uint32_t i = 0; i < LOC_ALPHA_COUNT; ++i)
    {
        const wchar_t letter = static_cast<wchar_t>(L'a' + static_cast<wchar_t>(i));
        const std::string strKey = Utf8Text({bKeypad ? keypad.GetPYNum(letter) : letter});
        // The letters of a key follow each other.
        if ((uMask >> i & 1U) != 0 && (vKeys.empty() || vKeys.back() != strKey))
        {
            vKeys.push_back(strKey);
        }
    }
    if ((uMask & MASK_OTHER) != 0)
    {
        vKeys.emplace_back("#");
    }
    return vKeys;
}
