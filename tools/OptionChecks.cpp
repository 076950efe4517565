#include "tools/OptionChecks.h"

#include <CLI/CLI.hpp>
#include <charconv>
#include <string>
#include <system_error>

namespace
{

bool IsWholeNumber(const std::string& strText, int64_t llMin, int64_t llMax)
{
    int64_t llValue = 0;
    const char* pEnd = strText.data() + strText.size();
    const std::from_chars_result result = std::from_chars(strText.data(), pEnd, llValue);
    return result.ec == std::errc() && result.ptr == pEnd && llValue >= llMin && llValue <= llMax;
}

} // namespace

CLI::Validator WholeNumber(int64_t llMin, int64_t llMax)
{
    return CLI::Validator(
        [llMin, llMax](const std::string& strText)
        {
            return IsWholeNumber(strText, llMin, llMax)
                       ? std::string()
                       : "\"" + strText + "\" is not a whole number from " + std::to_string(llMin) +
                             " to " + std::to_string(llMax);
        },
        ""); // nothing in the help: the option's description names the range
}
