#include "tools/Terminal.h"

#include "tools/ToolError.h"

#include <cerrno>
#include <clocale>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <langinfo.h>
#include <poll.h>
#include <string>
#include <sys/ioctl.h>
#include <sys/signalfd.h>
#include <unistd.h>

// Without the macros of curses, whose names are common words.
#define NCURSES_NOMACROS
#define NCURSES_WIDECHAR 1
#include <curses.h>
#include <term.h>

namespace
{

constexpr int SIGNALS[] = {SIGINT, SIGTERM, SIGHUP, SIGQUIT, SIGTSTP, SIGWINCH};
constexpr int ESCAPE_DELAY = 50; // milliseconds that the rest of a key's sequence may take
constexpr wint_t CONTROL_H = 0x08;
constexpr wint_t CONTROL_L = 0x0C;
constexpr wint_t ESCAPE = 0x1B;
constexpr wint_t DELETE = 0x7F;
constexpr wint_t FIRST_PRINTABLE = 0x20;

[[noreturn]] void Refuse(const std::string& strWhat, const std::string& strAdvice)
{
    throw CToolError(TOOL_EXIT_USAGE, strWhat, strAdvice);
}

void UseLocale()
{
    const char* szLocale = std::setlocale(LC_CTYPE, "");
    const std::string strCharset = szLocale == nullptr ? "unknown" : nl_langinfo(CODESET);
    if (strCharset != "UTF-8")
    {
        Refuse("the locale's character set is " + strCharset + ", which has no Chinese characters",
               "Choose a locale of UTF-8, for instance with LC_ALL=C.UTF-8.");
    }
}

std::FILE* OutputTerminal()
{
    for (std::FILE* pFile : {stdout, stderr})
    {
        if (isatty(fileno(pFile)) != 0)
        {
            return pFile;
        }
    }
    return nullptr;
}

SCREEN* OpenScreen(std::FILE* pOutput)
{
    SCREEN* pScreen = newterm(nullptr, pOutput, stdin);
    if (pScreen == nullptr || cursor_address == nullptr)
    {
        if (pScreen != nullptr)
        {
            endwin();
            delscreen(pScreen);
        }
        const char* szTerm = std::getenv("TERM");
        Refuse(std::string("a terminal of the type \"") + (szTerm == nullptr ? "" : szTerm) +
                   "\" cannot be drawn on",
               "Set TERM to the terminal's type, for instance xterm.");
    }
    return pScreen;
}

attr_t Attributes(unsigned uStyle)
{
    attr_t uAttributes = A_NORMAL;
    uAttributes |= (uStyle & STYLE_MATCHED) != 0 ? A_BOLD | A_UNDERLINE : A_NORMAL;
    uAttributes |= (uStyle & (STYLE_LIT | STYLE_HEADING)) != 0 ? A_BOLD : A_NORMAL;
    uAttributes |= (uStyle & STYLE_DIM) != 0 ? A_DIM : A_NORMAL;
    uAttributes |= (uStyle & STYLE_SELECTED) != 0 ? A_REVERSE : A_NORMAL;
    return uAttributes;
}

tag_Key FunctionKey(wint_t uCode)
{
    struct tag_CodedKey
    {
        wint_t uCode;
        KEY_KIND eKind;
    };
    static constexpr tag_CodedKey KEYS[] = {
        {KEY_BACKSPACE, KEY_ERASE}, {KEY_DC, KEY_ERASE},         {KEY_UP, KEY_ROW_UP},
        {KEY_DOWN, KEY_ROW_DOWN},   {KEY_PPAGE, KEY_PAGE_UP},    {KEY_NPAGE, KEY_PAGE_DOWN},
        {KEY_LEFT, KEY_TURN_LEFT},  {KEY_RIGHT, KEY_TURN_RIGHT}, {KEY_HOME, KEY_FIRST},
        {KEY_END, KEY_LAST},        {KEY_ENTER, KEY_CHOOSE},     {KEY_RESIZE, KEY_REDRAW},
    };
    for (const tag_CodedKey& key : KEYS)
    {
        if (key.uCode == uCode)
        {
            return {key.eKind, 0, 0};
        }
    }
    constexpr wint_t LAST_FUNCTION = KEY_F0 + 12;
    if (uCode > KEY_F0 && uCode <= LAST_FUNCTION)
    {
        return {KEY_FUNCTION, 0, static_cast<int>(uCode - KEY_F0)};
    }
    return {KEY_OTHER, 0, 0};
}

tag_Key CharacterKey(wint_t uCharacter)
{
    switch (uCharacter)
    {
    case L'\t':
        return {KEY_TAB_STOP, 0, 0};
    case L'\r':
    case L'\n':
        return {KEY_CHOOSE, 0, 0};
    case CONTROL_H:
    case DELETE:
        return {KEY_ERASE, 0, 0};
    case CONTROL_L:
        return {KEY_REDRAW, 0, 0};
    case ESCAPE:
        return {KEY_ESCAPE, 0, 0};
    default:
        return {uCharacter < FIRST_PRINTABLE ? KEY_OTHER : KEY_CHARACTER,
                static_cast<wchar_t>(uCharacter), 0};
    }
}

} // namespace

CSignalEvents::CSignalEvents()
{
    sigemptyset(&m_blocked);
    for (const int iSignal : SIGNALS)
    {
        struct sigaction action = {};
        sigaction(iSignal, nullptr, &action);
        if (action.sa_handler != SIG_IGN)
        {
            sigaddset(&m_blocked, iSignal);
        }
    }
    sigprocmask(SIG_BLOCK, &m_blocked, &m_before);
    m_iFd = signalfd(-1, &m_blocked, SFD_NONBLOCK | SFD_CLOEXEC);
    if (m_iFd < 0)
    {
        const int iError = errno;
        sigprocmask(SIG_SETMASK, &m_before, nullptr);
        throw CToolError(TOOL_EXIT_FAILED,
                         std::string("signals cannot be received: ") + std::strerror(iError));
    }
}

CSignalEvents::~CSignalEvents()
{
    close(m_iFd);
    sigprocmask(SIG_SETMASK, &m_before, nullptr);
}

int CSignalEvents::Next()
{
    signalfd_siginfo info = {};
    return read(m_iFd, &info, sizeof(info)) == sizeof(info) ? static_cast<int>(info.ssi_signo) : 0;
}

void CTerminal::Require()
{
    if (OutputTerminal() == nullptr || isatty(STDIN_FILENO) == 0)
    {
        Refuse("there is no terminal to type at",
               "Without one, searches are made with: qvlocalize search");
    }
    UseLocale();
}

CTerminal::CTerminal()
{
    Require();
    m_pOutput = OutputTerminal();
    set_escdelay(ESCAPE_DELAY);
    m_pScreen = OpenScreen(m_pOutput);
    cbreak();
    noecho();
    nonl();
    keypad(stdscr, TRUE);
    nodelay(stdscr, TRUE);
}

CTerminal::~CTerminal()
{
    endwin();
    delscreen(static_cast<SCREEN*>(m_pScreen));
    // What curses made of them is of no use any more.
    for (const int iSignal : {SIGINT, SIGTERM, SIGTSTP, SIGWINCH})
    {
        struct sigaction action = {};
        sigaction(iSignal, nullptr, &action);
        if (action.sa_handler != SIG_IGN)
        {
            std::signal(iSignal, SIG_DFL);
        }
    }
}

tag_ScreenSize CTerminal::Size() const
{
    return {getmaxy(stdscr), getmaxx(stdscr)};
}

void CTerminal::Draw(const tag_Screen& screen)
{
    werase(stdscr);
    int iRow = 0;
    for (const StyledLine& line : screen.vLines)
    {
        wmove(stdscr, iRow, 0);
        for (const tag_StyledText& text : line)
        {
            wattrset(stdscr, static_cast<int>(Attributes(text.uStyle)));
            waddstr(stdscr, text.strText.c_str());
        }
        ++iRow;
    }
    wattrset(stdscr, A_NORMAL);
    wmove(stdscr, screen.iCursorRow, screen.iCursorColumn);
    wrefresh(stdscr);
}

tag_Key CTerminal::Wait(std::chrono::milliseconds timeout)
{
    tag_Key key = {KEY_IDLE, 0, 0};
    if (ReadKey(key))
    {
        return key;
    }
    pollfd aWaiting[] = {{m_signals.Descriptor(), POLLIN, 0}, {STDIN_FILENO, POLLIN, 0}};
    if (poll(aWaiting, std::size(aWaiting), static_cast<int>(timeout.count())) <= 0)
    {
        return key;
    }
    if (aWaiting[0].revents != 0)
    {
        return HandleSignal();
    }
    if (!ReadKey(key) && (aWaiting[1].revents & (POLLHUP | POLLERR | POLLNVAL)) != 0)
    {
        return {KEY_SIGNAL, 0, SIGHUP}; // the terminal is gone
    }
    return key;
}

// Whether there is a key.
bool CTerminal::ReadKey(tag_Key& key)
{
    wint_t uCode = 0;
    switch (wget_wch(stdscr, &uCode))
    {
    case KEY_CODE_YES:
        key = FunctionKey(uCode);
        break;
    case OK:
        key = CharacterKey(uCode);
        break;
    default:
        return false;
    }
    if (key.eKind == KEY_REDRAW)
    {
        wclear(stdscr);
    }
    return true;
}

tag_Key CTerminal::HandleSignal()
{
    const int iSignal = m_signals.Next();
    switch (iSignal)
    {
    case 0:
        return {KEY_IDLE, 0, 0};
    case SIGWINCH:
        Resize();
        return {KEY_REDRAW, 0, 0};
    case SIGTSTP:
        Suspend();
        return {KEY_REDRAW, 0, 0};
    default:
        return {KEY_SIGNAL, 0, iSignal};
    }
}

// Stops the process as if the signal had not been caught, and takes the terminal back when the
// process goes on.
void CTerminal::Suspend()
{
    def_prog_mode();
    endwin();
    struct sigaction ofCurses = {};
    struct sigaction stop = {};
    stop.sa_handler = SIG_DFL;
    sigaction(SIGTSTP, &stop, &ofCurses);
    raise(SIGTSTP);
    sigset_t stopSet;
    sigset_t before;
    sigemptyset(&stopSet);
    sigaddset(&stopSet, SIGTSTP);
    sigprocmask(SIG_UNBLOCK, &stopSet, &before); // stops here
    sigprocmask(SIG_SETMASK, &before, nullptr);
    sigaction(SIGTSTP, &ofCurses, nullptr);
    reset_prog_mode();
    Resize();
    wclear(stdscr);
}

void CTerminal::Resize()
{
    winsize size = {};
    if (ioctl(fileno(m_pOutput), TIOCGWINSZ, &size) == 0 && size.ws_row > 0 && size.ws_col > 0)
    {
        resizeterm(size.ws_row, size.ws_col);
    }
}

void EndBySignal(int iSignal)
{
    std::signal(iSignal, SIG_DFL);
    raise(iSignal);
    std::abort(); // not reached: the signals that end the program end it by default
}
