#include "tools/LocalizerKeys.h"

#include "Core/LocalizerLogic.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/LibraryLog.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

namespace
{

void MakeSharedTable()
{
    CLibraryLog log;
    if (CQVLocalizerManager::InitMapFile() != 0)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not make its pinyin table", "",
                         log.Errors());
    }
}

// The pinyin table, open for as long as names are converted.
class CKeyMaker
{
public:
    CKeyMaker() : m_hMapping(m_logic.CreatePinYinFileMapping())
    {
        if (m_hMapping == -1)
        {
            throw CToolError(TOOL_EXIT_FAILED, "the library could not open its pinyin table");
        }
    }
    ~CKeyMaker() { m_logic.ReleasePinYinFileMapping(m_hMapping); }
    CKeyMaker(const CKeyMaker&) = delete;
    CKeyMaker& operator=(const CKeyMaker&) = delete;

    std::string KeyOf(const std::string& strName)
    {
        std::wstring wstrName = WideText(strName);
        wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
        if (m_logic.GetLocalizerString(m_hMapping, wstrName.data(), szCodes) != 0)
        {
            throw CToolError(TOOL_EXIT_FAILED, "the library could not convert the name " + strName);
        }
        return Utf8Text(szCodes);
    }

private:
    CLocalizerLogic m_logic;
    long m_hMapping;
};

} // namespace

void FillLocalizerKeys(std::vector<tag_SampleContact>& vContacts)
{
    MakeSharedTable();
    CKeyMaker maker;
    for (tag_SampleContact& contact : vContacts)
    {
        contact.strKey = maker.KeyOf(contact.strName);
    }
}
