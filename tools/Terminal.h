#ifndef QV_TOOLS_TERMINAL_H
#define QV_TOOLS_TERMINAL_H

#include "tools/TypingView.h"

#include <chrono>
#include <csignal>
#include <cstdio>
#include <memory>

// Keys of the user and events of the system.
enum KEY_KIND
{
    KEY_IDLE,      // nothing came in the time given
    KEY_CHARACTER, // chCharacter
    KEY_TAB_STOP,
    KEY_ERASE,
    KEY_ROW_UP,
    KEY_ROW_DOWN,
    KEY_PAGE_UP,
    KEY_PAGE_DOWN,
    KEY_TURN_LEFT,
    KEY_TURN_RIGHT,
    KEY_FIRST,
    KEY_LAST,
    KEY_FUNCTION, // iNumber: 2 for F2
    KEY_CHOOSE,
    KEY_ESCAPE,
    KEY_REDRAW, // the screen has another size or has to be drawn again
    KEY_SIGNAL, // iNumber: the signal that asks the program to end
    KEY_OTHER,
};

struct tag_Key
{
    KEY_KIND eKind;
    wchar_t chCharacter;
    int iNumber;
};

// Receives the signals that end, stop or resize as events instead of interruptions, so that the
// terminal is never left in an intermediate state. Signals that were ignored at the start stay
// ignored. The destructor restores everything.
class CSignalEvents
{
public:
    CSignalEvents();
    ~CSignalEvents();
    CSignalEvents(const CSignalEvents&) = delete;
    CSignalEvents& operator=(const CSignalEvents&) = delete;

    int Descriptor() const { return m_iFd; }
    // The signal that arrived first, 0 if there is none.
    int Next();

private:
    sigset_t m_blocked;
    sigset_t m_before;
    int m_iFd;
};

// The terminal while a program draws on all of it. The destructor restores it, also during an
// exception.
class CTerminal
{
public:
    // Reads keys from the standard input and draws on the standard output, or on the error output
    // when the standard output goes elsewhere. Throws CToolError like Require, and when the
    // terminal is of a type that cannot be drawn on.
    CTerminal();
    ~CTerminal();
    CTerminal(const CTerminal&) = delete;
    CTerminal& operator=(const CTerminal&) = delete;

    // Throws CToolError with TOOL_EXIT_USAGE unless there is a terminal and the locale is one of
    // UTF-8, whose character types the process uses from now on.
    static void Require();

    tag_ScreenSize Size() const;
    void Draw(const tag_Screen& screen);
    // The next key. Stops and resumes the process when a signal asks for it.
    tag_Key Wait(std::chrono::milliseconds timeout);

private:
    bool ReadKey(tag_Key& key);
    tag_Key HandleSignal();
    void Suspend();
    void Resize();

    CSignalEvents m_signals;
    std::FILE* m_pOutput;
    void* m_pScreen; // curses' own
};

// Ends the process by the signal, as if nothing had caught it.
[[noreturn]] void EndBySignal(int iSignal);

#endif
