#include "DBOperator/ContactRow.h"

#include "Common/Utf8.h"
#include "DBOperator/SqlStatement.h"

#include <algorithm>

namespace
{

enum CONTACTS_COLUMN
{
    CONTACTS_ID,
    CONTACTS_TIMES,
    CONTACTS_STARRED,
    CONTACTS_PHONE,
    CONTACTS_LAST_TIME,
    CONTACTS_SECRET
};

enum LOCALIZER_COLUMN
{
    LOCALIZER_NAME = LOCALIZER_ID_COLUMN + 1,
    LOCALIZER_KEY,
    LOCALIZER_GROUPS,
    LOCALIZER_ACCOUNTS,
    LOCALIZER_MAIL,
    LOCALIZER_ADDRESS
};

// Index of the last byte that is decoded: 30 letters or ten Chinese characters of a name, 13
// three-byte codes of a key, of which the first ten are kept.
constexpr int NAME_LAST_BYTE = 29;
constexpr int KEY_LAST_BYTE = 39;
constexpr int TEXT_BUFFER = 100;
static_assert(NAME_LAST_BYTE + 1 < TEXT_BUFFER && KEY_LAST_BYTE + 1 < TEXT_BUFFER,
              "a byte gives one unit at most, and a terminator follows");

// A flag column holds 0 or 1; any other value also sets bits above the flag.
uint32_t FlagBits(const CSqlStatement& row, int iColumn, uint32_t uFlag)
{
    return static_cast<uint32_t>(row.Int(iColumn)) * uFlag;
}

// Of text that is not valid UTF-8, the part before the fault is kept.
void CopyText(const CSqlStatement& row, int iColumn, int iLastByte, wchar_t* pField, int iMaxUnits)
{
    const char* szText = row.Text(iColumn);
    if (szText == nullptr || szText[0] == '\0')
    {
        return;
    }
    wchar_t szUnits[TEXT_BUFFER] = {};
    _mbstowcs(szUnits, szText, std::min(row.Bytes(iColumn), iLastByte));
    std::copy_n(szUnits, iMaxUnits, pField);
    pField[iMaxUnits] = 0;
}

void AddSecretGroup(tag_ContactsStruct* pContact)
{
    QVLong32* pEnd = pContact->lGroupID + CONTACT_MAX_GROUPS;
    QVLong32* pFree = std::find(pContact->lGroupID, pEnd, 0);
    if (pFree != pEnd)
    {
        *pFree = SECRET_GROUP_ID;
    }
}

bool IsDigit(char c)
{
    return c >= '0' && c <= '9';
}

} // namespace

void FillFromContactsRow(const CSqlStatement& row, tag_ContactsStruct* pContact)
{
    pContact->iContactID = row.Int(CONTACTS_ID);
    pContact->iTimesContacted = row.Int(CONTACTS_TIMES);
    pContact->iFlags |= FlagBits(row, CONTACTS_STARRED, CONTACT_FLAG_STARRED);
    pContact->iFlags |= FlagBits(row, CONTACTS_PHONE, CONTACT_FLAG_PHONE);
    pContact->llLastTimeContacted = row.Int64(CONTACTS_LAST_TIME);
    pContact->iFlags |= FlagBits(row, CONTACTS_SECRET, CONTACT_FLAG_SECRET);
}

bool FillFromLocalizerRow(const CSqlStatement& row, int iMaxGroups, tag_ContactsStruct* pContact)
{
    CopyText(row, LOCALIZER_NAME, NAME_LAST_BYTE, pContact->szName, CONTACT_MAX_NAME);
    CopyText(row, LOCALIZER_KEY, KEY_LAST_BYTE, pContact->szLocalizerKey, CONTACT_MAX_KEY);
    ParseIdText(row.Text(LOCALIZER_GROUPS), pContact->lGroupID, iMaxGroups);
    if ((pContact->iFlags & CONTACT_FLAG_SECRET) != 0)
    {
        AddSecretGroup(pContact);
    }
    ParseIdText(row.Text(LOCALIZER_ACCOUNTS), pContact->lAccountID, CONTACT_MAX_ACCOUNTS);
    pContact->iFlags |= FlagBits(row, LOCALIZER_MAIL, CONTACT_FLAG_MAIL);
    pContact->iFlags |= FlagBits(row, LOCALIZER_ADDRESS, CONTACT_FLAG_ADDRESS);
    return !row.IsOutOfMemory();
}

void ParseIdText(const char* szText, QVLong32* pIds, int iMax)
{
    if (szText == nullptr || pIds == nullptr || szText[0] == '\0')
    {
        return;
    }
    uint32_t uId = 0;
    int iCount = 0;
    for (; IsDigit(*szText) || (*szText == '.' && iCount < iMax); ++szText)
    {
        if (*szText == '.')
        {
            pIds[iCount++] = static_cast<QVLong32>(uId);
            uId = 0;
        }
        else
        {
            uId = uId * 10 + static_cast<uint32_t>(*szText - '0');
        }
    }
    if (*szText == '\0' && iCount < iMax)
    {
        pIds[iCount] = static_cast<QVLong32>(uId);
    }
}
