#include "tests/Support/LogCapture.h"

#include "Platform/LogSink.h"

#include <algorithm>
#include <ostream>

std::ostream& operator<<(std::ostream& stream, const tag_LogLine& line)
{
    return stream << '[' << line.iPriority << ' ' << line.strTag << "] " << line.strText;
}

CLogCapture::CLogCapture()
{
    CLogSink::Set(&CLogCapture::Collect, this);
}

CLogCapture::~CLogCapture()
{
    CLogSink::Set(nullptr, nullptr);
}

std::vector<std::string> CLogCapture::Texts(int iPriority) const
{
    std::vector<std::string> vTexts;
    for (const tag_LogLine& line : m_vLines)
    {
        if (line.iPriority == iPriority)
        {
            vTexts.push_back(line.strText);
        }
    }
    return vTexts;
}

int CLogCapture::Count(int iPriority, const std::string& strText) const
{
    return static_cast<int>(std::count_if(m_vLines.begin(), m_vLines.end(),
                                          [&](const tag_LogLine& line) {
                                              return line.iPriority == iPriority &&
                                                     line.strText == strText;
                                          }));
}

void CLogCapture::Collect(void* pContext, int iPriority, const char* szTag, const char* szText)
{
    auto* pLog = static_cast<CLogCapture*>(pContext);
    pLog->m_vLines.push_back({iPriority, szTag, szText});
    if (pLog->m_fnAtLine)
    {
        pLog->m_fnAtLine(szText);
    }
}
