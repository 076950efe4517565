#ifndef QV_TESTS_SUPPORT_LOGCAPTURE_H
#define QV_TESTS_SUPPORT_LOGCAPTURE_H

#include "Platform/LogSink.h"

#include <functional>
#include <string>
#include <utility>
#include <vector>

constexpr int DEBUG_LINE = 3;
constexpr int ERROR_LINE = 6;

using Lines = std::vector<std::string>;

// One line of the library's log.
struct tag_LogLine
{
    int iPriority;
    std::string strTag;
    std::string strText;
};

// Collects every log line for as long as the object lives, one object at a time.
class CLogCapture
{
public:
    CLogCapture() { CLogSink::Set(&CLogCapture::Collect, this); }
    ~CLogCapture() { CLogSink::Set(nullptr, nullptr); }
    CLogCapture(const CLogCapture&) = delete;
    CLogCapture& operator=(const CLogCapture&) = delete;

    const std::vector<tag_LogLine>& Lines() const { return m_vLines; }
    // The texts of the lines with the priority, in order.
    std::vector<std::string> Texts(int iPriority) const
    {
        std::vector<std::string> vTexts;
        for (const tag_LogLine& line : m_vLines)
        {
            vTexts.insert(vTexts.end(), line.iPriority == iPriority ? 1U : 0U, line.strText);
        }
        return vTexts;
    }
    // All lines since the last Take or Clear, with a dollar sign behind each: some texts end with a
    // line end of their own.
    std::string Take()
    {
        std::string strTaken;
        for (const auto& [iPriority, strTag, strText] : m_vLines)
        {
            strTaken += "[" + std::to_string(iPriority) + " " + strTag + "] " + strText + "$\n";
        }
        Clear();
        return strTaken;
    }
    void Clear() { m_vLines.clear(); }
    // Runs a function at every line, in the middle of the operation that logs it: this is how a
    // test plays the other process at an exact moment.
    void AtEachLine(std::function<void(const std::string&)> fnAtLine)
    {
        m_fnAtLine = std::move(fnAtLine);
    }
    // The same at the lines that hold a text.
    void AtLinesWith(const std::string& strPart, const std::function<void()>& fnAtLine)
    {
        AtEachLine(
            [strPart, fnAtLine](const std::string& strText)
            {
                if (strText.find(strPart) != std::string::npos)
                {
                    fnAtLine();
                }
            });
    }

private:
    static void Collect(void* pContext, int iPriority, const char* szTag, const char* szText)
    {
        auto* pLog = static_cast<CLogCapture*>(pContext);
        pLog->m_vLines.push_back({iPriority, szTag, szText});
        if (pLog->m_fnAtLine)
        {
            pLog->m_fnAtLine(szText);
        }
    }

    std::vector<tag_LogLine> m_vLines;
    std::function<void(const std::string&)> m_fnAtLine;
};

#endif
