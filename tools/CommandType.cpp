#include "tools/Commands.h"
#include "tools/DataDirectory.h"
#include "tools/FilterOptions.h"
#include "tools/PrintableText.h"
#include "tools/Terminal.h"
#include "tools/TypingModel.h"
#include "tools/TypingView.h"

#include <CLI/CLI.hpp>
#include <iostream>
#include <memory>

namespace
{

// How often the index is checked while no key is pressed.
constexpr std::chrono::milliseconds INDEX_LOOK(250);
constexpr int FIRST_FILTER_KEY = 2; // F2

constexpr const char* KEYS_HELP =
    "Keys: letters, or keypad digits after Tab; 1 to 9 pick a character for the letters typed\n"
    "  last; Backspace goes back to the result before; arrows, Page keys, Home and End move in "
    "the\n"
    "  list; Left and Right turn to more characters, or with nothing typed to another section;\n"
    "  F2 favourites, F3 phone, F4 online; Enter prints the contact's id, a tab and the name, and\n"
    "  ends; Esc ends. The last line shows the microseconds that the library took for the key.";

struct tag_TypeOptions
{
    CDataDirectory directory;
    CFilterOptions filters;
    bool bDigits = false;
};

// How the session ended.
struct tag_Outcome
{
    int iSignal = 0;
    std::unique_ptr<tag_FoundContact> pChosen;
};

// Keys that change what is shown.
void Apply(CTypingModel& model, const tag_Key& key)
{
    switch (key.eKind)
    {
    case KEY_CHARACTER:
        return model.Type(key.chCharacter);
    case KEY_TAB_STOP:
        return model.SwitchKeys();
    case KEY_ERASE:
        return model.Back();
    case KEY_ROW_UP:
    case KEY_ROW_DOWN:
        return model.MoveBy(key.eKind == KEY_ROW_UP ? -1 : 1);
    case KEY_PAGE_UP:
    case KEY_PAGE_DOWN:
        return model.MoveByPages(key.eKind == KEY_PAGE_UP ? -1 : 1);
    case KEY_TURN_LEFT:
    case KEY_TURN_RIGHT:
        return model.Turn(key.eKind == KEY_TURN_LEFT ? -1 : 1);
    case KEY_FIRST:
    case KEY_LAST:
        return model.MoveToEnd(key.eKind == KEY_LAST);
    case KEY_FUNCTION:
        if (key.iNumber >= FIRST_FILTER_KEY &&
            key.iNumber - FIRST_FILTER_KEY < static_cast<int>(FILTER_SWITCHES.size()))
        {
            model.SwitchFilter(static_cast<size_t>(key.iNumber - FIRST_FILTER_KEY));
        }
        return;
    case KEY_IDLE:
        return model.FollowIndex();
    default:
        return;
    }
}

tag_Outcome TypeUntilEnd(CTypingModel& model)
{
    CTerminal terminal;
    for (;;)
    {
        terminal.Draw(LayOut(model, terminal.Size()));
        const tag_Key key = terminal.Wait(INDEX_LOOK);
        if (key.eKind == KEY_SIGNAL)
        {
            return {key.iNumber, nullptr};
        }
        if (key.eKind == KEY_ESCAPE)
        {
            return {};
        }
        if (key.eKind == KEY_CHOOSE)
        {
            std::unique_ptr<tag_FoundContact> pChosen = model.Selected();
            if (pChosen != nullptr)
            {
                return {0, std::move(pChosen)};
            }
            continue;
        }
        Apply(model, key);
    }
}

void RunType(const tag_TypeOptions& options)
{
    CTerminal::Require();
    options.directory.Use();
    options.directory.RequireDatabase();
    options.directory.RequireIndex();
    CTypingModel model(options.filters.Chosen(), options.bDigits ? TYPING_DIGITS : TYPING_LETTERS);
    const tag_Outcome outcome = TypeUntilEnd(model);
    if (outcome.iSignal != 0)
    {
        EndBySignal(outcome.iSignal);
    }
    if (outcome.pChosen != nullptr)
    {
        std::cout << outcome.pChosen->detail.iContactID << '\t'
                  << PrintableText(outcome.pChosen->strName) << '\n';
    }
}

} // namespace

void AddTypeCommand(CLI::App& app)
{
    auto pOptions = std::make_shared<tag_TypeOptions>();
    CLI::App* pCommand = app.add_subcommand(
        "type", "Search while typing in the terminal, and print the contact that is chosen");
    pOptions->directory.AddOption(*pCommand);
    pCommand->add_flag("--digits", pOptions->bDigits, "Begin with keypad digits");
    pOptions->filters.AddOptions(*pCommand);
    pCommand->footer(std::string(KEYS_HELP) + "\n\n" + app.get_footer());
    pCommand->callback([pOptions] { RunType(*pOptions); });
}
