#include "tools/Utf8Text.h"

#include "Common/Utf8.h"

namespace
{

constexpr size_t MAX_BYTES_OF_UNIT = 3;

bool IsContinuation(char c)
{
    return (static_cast<unsigned char>(c) & 0xC0U) == 0x80U;
}

} // namespace

std::wstring WideText(const std::string& strUtf8, bool* pbWhole)
{
    std::wstring wstrText(strUtf8.size() + 1, L'\0');
    const int iResult =
        _mbstowcs(wstrText.data(), strUtf8.c_str(), static_cast<int>(strUtf8.size()));
    if (pbWhole != nullptr)
    {
        *pbWhole = iResult >= 0;
    }
    wstrText.resize(wstrText.find(L'\0'));
    return wstrText;
}

std::string Utf8Text(const std::wstring& wstrText)
{
    std::string strUtf8(wstrText.size() * MAX_BYTES_OF_UNIT + 1, '\0');
    const int iBytes =
        _wcstombs(strUtf8.data(), wstrText.c_str(), static_cast<int>(wstrText.size()));
    strUtf8.resize(static_cast<size_t>(iBytes));
    return strUtf8;
}

std::vector<std::string> Characters(const std::string& strUtf8)
{
    std::vector<std::string> vCharacters;
    for (const char c : strUtf8)
    {
        if (vCharacters.empty() || !IsContinuation(c))
        {
            vCharacters.emplace_back();
        }
        vCharacters.back() += c;
    }
    return vCharacters;
}
