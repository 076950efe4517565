#include "tools/LocalizerKeys.h"

#include "Common/DataPaths.h"
#include "LocalizerImpl/QVLocalizerManager.h"
#include "tools/LibraryLog.h"
#include "tools/ToolError.h"
#include "tools/Utf8Text.h"

#include <filesystem>
#include <system_error>

namespace fs = std::filesystem;

namespace
{

void MakeSharedTable()
{
    const CLibraryLog log;
    if (CQVLocalizerManager::InitMapFile() != 0)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not make its pinyin table", "",
                         log.Errors());
    }
}

} // namespace

CLocalizerKeys::CLocalizerKeys(bool bRenew)
{
    std::error_code error;
    if (bRenew || !fs::exists(CDataPaths::PinyinMapping(), error))
    {
        MakeSharedTable();
    }
    m_hMapping = m_logic.CreatePinYinFileMapping();
    if (m_hMapping == -1)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not open its pinyin table");
    }
}

CLocalizerKeys::~CLocalizerKeys()
{
    m_logic.ReleasePinYinFileMapping(m_hMapping);
}

std::string CLocalizerKeys::KeyOf(const std::string& strName)
{
    std::wstring wstrName = WideText(strName);
    wchar_t szCodes[CONTACT_MAX_KEY + 1] = {};
    if (m_logic.GetLocalizerString(m_hMapping, wstrName.data(), szCodes) != 0)
    {
        throw CToolError(TOOL_EXIT_FAILED, "the library could not convert the name " + strName);
    }
    return Utf8Text(szCodes);
}
