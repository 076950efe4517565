#ifndef QV_TESTS_SUPPORT_WIDETEXT_H
#define QV_TESTS_SUPPORT_WIDETEXT_H

#include "Common/Utf8.h"

#include <algorithm>
#include <string>

inline std::wstring Wide(const std::string& strUtf8)
{
    std::wstring strWide(strUtf8.size(), L'\0');
    const int iUnits =
        Utf82Unicode(strUtf8.c_str(), strWide.data(), static_cast<int>(strUtf8.size()) - 1);
    strWide.resize(static_cast<size_t>(std::max(iUnits, 0)));
    return strWide;
}

inline std::string Narrow(const std::wstring& strWide)
{
    std::string strUtf8(strWide.size() * 3, '\0');
    strUtf8.resize(static_cast<size_t>(
        Unicode2Utf8(strWide.c_str(), strUtf8.data(), static_cast<int>(strWide.size()) - 1)));
    return strUtf8;
}

#endif
