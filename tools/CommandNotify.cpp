#include "Core/LocalizerLogic.h"
#include "tools/Commands.h"
#include "tools/DataDirectory.h"
#include "tools/IndexUpdate.h"
#include "tools/LibraryLog.h"
#include "tools/OptionChecks.h"

#include <CLI/CLI.hpp>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace
{

struct tag_NotifyOptions
{
    CDataDirectory directory;
    std::vector<long long> vIds;
    long lId = 0;
    long long llTime = 0;
    bool bStarred = true;
};

using OptionsPtr = std::shared_ptr<tag_NotifyOptions>;
using Handler = std::function<void(CLocalizerLogic&, tag_NotifyOptions&)>;

void TellContacts(CLocalizerLogic& logic, tag_NotifyOptions& options)
{
    if (options.vIds.empty())
    {
        logic.OnContactsTableChanged();
    }
    else
    {
        logic.OnContactsTableChanged(static_cast<int>(options.vIds.size()), options.vIds.data());
    }
}

void RunNotify(tag_NotifyOptions& options, const Handler& fnHandler)
{
    options.directory.Use();
    options.directory.RequireDatabase();
    options.directory.RequireIndex();
    const CLibraryLog log;
    CLocalizerLogic logic;
    fnHandler(logic, options);
    PrintCompleteIndex(log);
}

CLI::App* AddEvent(CLI::App& notify, const OptionsPtr& pOptions, const char* szName,
                   const char* szMeaning, const Handler& fnHandler)
{
    CLI::App* pEvent = notify.add_subcommand(szName, szMeaning);
    pEvent->fallthrough(); // --data-dir may follow the event
    pEvent->callback([pOptions, fnHandler] { RunNotify(*pOptions, fnHandler); });
    return pEvent;
}

void AddContactId(CLI::App& event, tag_NotifyOptions& options)
{
    event.add_option("id", options.lId, "The contact")
        ->required()
        ->type_name("N")
        ->check(WholeNumber(1, MAX_INT));
}

void AddEvents(CLI::App& notify, const OptionsPtr& pOptions)
{
    AddEvent(notify, pOptions, "contacts", "Contacts appeared, changed or went", TellContacts)
        ->add_option("ids", pOptions->vIds,
                     "The contacts; all of them without one. More than 200 rebuild the index")
        ->type_name("N")
        ->check(WholeNumber(1, MAX_INT));
    AddEvent(notify, pOptions, "status", "Contacts went online or offline",
             [](CLocalizerLogic& logic, tag_NotifyOptions& /*options*/)
             { logic.OnStatusUpdatesTableChanged(0, nullptr); });
    CLI::App* pTime = AddEvent(notify, pOptions, "time", "A contact was contacted",
                               [](CLocalizerLogic& logic, tag_NotifyOptions& options)
                               { logic.OnContactTimeChanged(options.lId, options.llTime); });
    AddContactId(*pTime, *pOptions);
    pTime->add_option("ms", pOptions->llTime, "When, in milliseconds since 1970")
        ->required()
        ->type_name("N")
        ->check(WholeNumber(0, MAX_TIME_MS));
    CLI::App* pStar =
        AddEvent(notify, pOptions, "star", "A contact became a favourite",
                 [](CLocalizerLogic& logic, tag_NotifyOptions& options)
                 { logic.OnContactStarChanged(options.lId, options.bStarred ? 1 : 0); });
    AddContactId(*pStar, *pOptions);
    pStar->add_flag("!--off", pOptions->bStarred, "It ceased to be one");
}

} // namespace

void AddNotifyCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_NotifyOptions>();
    CLI::App* pCommand = app.add_subcommand(
        "notify", "Tell the library what changed in the database, as the provider does");
    pOptions->directory.AddOption(*pCommand);
    pCommand->require_subcommand(1);
    AddEvents(*pCommand, pOptions);
}
