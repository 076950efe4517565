#ifndef QV_TESTS_SUPPORT_LOGCAPTURE_H
#define QV_TESTS_SUPPORT_LOGCAPTURE_H

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

    bool operator==(const tag_LogLine& other) const
    {
        return iPriority == other.iPriority && strTag == other.strTag && strText == other.strText;
    }
};
std::ostream& operator<<(std::ostream& stream, const tag_LogLine& line);

// Collects every log line for as long as the object lives, one object at a time.
class CLogCapture
{
public:
    CLogCapture();
    ~CLogCapture();
    CLogCapture(const CLogCapture&) = delete;
    CLogCapture& operator=(const CLogCapture&) = delete;

    const std::vector<tag_LogLine>& Lines() const { return m_vLines; }
    // The texts of the lines with the priority, in order.
    std::vector<std::string> Texts(int iPriority) const;
    // How many lines have exactly this priority and text.
    int Count(int iPriority, const std::string& strText) const;
    bool Has(int iPriority, const std::string& strText) const
    {
        return Count(iPriority, strText) > 0;
    }
    void Clear() { m_vLines.clear(); }
    // Runs a function at every line, in the middle of the operation that logs it: this is how a
    // test plays the other process at an exact moment.
    void AtEachLine(std::function<void(const std::string&)> fnAtLine)
    {
        m_fnAtLine = std::move(fnAtLine);
    }

private:
    static void Collect(void* pContext, int iPriority, const char* szTag, const char* szText);

    std::vector<tag_LogLine> m_vLines;
    std::function<void(const std::string&)> m_fnAtLine;
};

#endif
