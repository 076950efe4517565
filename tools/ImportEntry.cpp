#include "tools/ImportEntry.h"

#include <nlohmann/json.hpp>
#include <stdexcept>

using nlohmann::json;

namespace
{

constexpr const char* BLANKS = " \t\r\n";

std::string Trimmed(const std::string& strText)
{
    const size_t uFrom = strText.find_first_not_of(BLANKS);
    if (uFrom == std::string::npos)
    {
        return "";
    }
    return strText.substr(uFrom, strText.find_last_not_of(BLANKS) - uFrom + 1);
}

[[noreturn]] void Refuse(const std::string& strReason)
{
    throw std::invalid_argument(strReason);
}

std::string TextOf(const json& value, const char* szMember)
{
    if (!value.is_string())
    {
        Refuse(std::string("\"") + szMember + "\" is no text");
    }
    const auto& strText = value.get_ref<const std::string&>();
    if (strText.find('\0') != std::string::npos)
    {
        Refuse(std::string("\"") + szMember + "\" holds a zero character");
    }
    return Trimmed(strText);
}

// A null member counts as missing.
const json* Member(const json& object, const char* szMember)
{
    const auto found = object.find(szMember);
    return found == object.end() || found->is_null() ? nullptr : &*found;
}

std::string Text(const json& object, const char* szMember)
{
    const json* pValue = Member(object, szMember);
    return pValue == nullptr ? "" : TextOf(*pValue, szMember);
}

std::optional<bool> Flag(const json& object, const char* szMember)
{
    const json* pValue = Member(object, szMember);
    if (pValue == nullptr)
    {
        return std::nullopt;
    }
    if (!pValue->is_boolean())
    {
        Refuse(std::string("\"") + szMember + "\" is neither true nor false");
    }
    return pValue->get<bool>();
}

// The texts of a list that are not empty.
std::optional<std::vector<std::string>> Texts(const json& object, const char* szMember)
{
    const json* pValue = Member(object, szMember);
    if (pValue == nullptr)
    {
        return std::nullopt;
    }
    if (!pValue->is_array())
    {
        Refuse(std::string("\"") + szMember + "\" is no list");
    }
    std::vector<std::string> vTexts;
    for (const json& value : *pValue)
    {
        const std::string strText = TextOf(value, szMember);
        if (!strText.empty())
        {
            vTexts.push_back(strText);
        }
    }
    return vTexts;
}

std::optional<bool> HasAny(const json& object, const char* szMember)
{
    const auto vTexts = Texts(object, szMember);
    return vTexts ? std::optional<bool>(!vTexts->empty()) : std::nullopt;
}

void ReadLineNumber(const json& object, tag_ImportEntry& entry)
{
    const json* pValue = Member(object, "line");
    if (pValue != nullptr && pValue->is_number_integer())
    {
        entry.lLine = pValue->get<long>();
    }
}

void ReadMembers(const json& object, tag_ImportEntry& entry)
{
    if (!object.is_object())
    {
        Refuse("not a JSON object");
    }
    ReadLineNumber(object, entry);
    const std::string strError = Text(object, "error");
    if (!strError.empty())
    {
        Refuse(strError);
    }
    entry.strName = Text(object, "name");
    if (entry.strName.empty())
    {
        Refuse("no name");
    }
    entry.strUid = Text(object, "uid");
    entry.bPhone = HasAny(object, "phones");
    entry.bMail = HasAny(object, "mails");
    entry.bAddress = HasAny(object, "addresses");
    entry.bStarred = Flag(object, "starred");
    entry.vGroups = Texts(object, "groups");
}

} // namespace

tag_ImportEntry ReadImportEntry(const std::string& strLine, long lLine)
{
    tag_ImportEntry entry;
    entry.lLine = lLine;
    try
    {
        ReadMembers(json::parse(strLine), entry);
    }
    catch (const json::exception&)
    {
        entry.strReason = "not JSON in UTF-8";
    }
    catch (const std::invalid_argument& reason)
    {
        entry.strReason = reason.what();
    }
    return entry;
}
