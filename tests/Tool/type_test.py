"""Types at qvlocalize in a real pseudo-terminal, which tmux keeps, and compares the screen.

type_test.py TOOL PYFILE [--record] [TestClass...]

--record writes the screens anew, for people to look through; without it they are compared.
"""
import os
import pathlib
import re
import shlex
import shutil
import signal
import subprocess
import sys
import time
import unittest

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
from tool_case import PYFILE, SKIPPED, TOOL, USAGE, ToolCase

RECORD = "--record" in sys.argv
SCREENS = pathlib.Path(__file__).parent / "screens"
SIZES = [(40, 12), (80, 24), (132, 43)]
PROMPT = "shell>"
PATIENCE = 60  # seconds until a screen that does not come is a failure
ENVIRONMENT = {**os.environ, "LC_ALL": "C.UTF-8",
               "LSAN_OPTIONS": f"suppressions={SCREENS.with_name('ncurses.supp')}:"
                               "print_suppressions=0"}
ENVIRONMENT.pop("TMUX", None)

# What a scenario presses, and the name of the screen that has to follow.
SCENARIO = [
    ([], "nothing typed"),
    (["PageDown", "Right"], "another section"),
    (["Home", "z", "h", "a", "n", "g", "s"], "zhangs"),
    (["2"], "the second character picked"),
    (["BSpace"], "zhangs"),
    (["BSpace", "BSpace", "BSpace", "Right", "Down", "Down"], "zha, more characters"),
    (["F2"], "zha, favourites"),
    (["F3", "F4"], "zha, favourites with a phone who are online"),
    (["F2", "F3", "F4", "Tab"], "digits"),
    (["9", "4"], "94"),
    (["2", "6", "4", "7", "2", "6"], "94264726"),
    (["8"], "nobody"),
    (["x"], "a key that digits do not have"),
]


def without_styles(text):
    """The text of a screen with underlined characters in braces: those that matched."""
    plain, underlined = "", False
    for part in re.split(r"(\x1b\[[\d;]*m)", text):
        if not part.startswith("\x1b["):
            plain += part
            continue
        was = underlined
        for code in part[2:-1].split(";"):
            underlined = code == "4" or (underlined and code not in ("", "0", "24"))
        plain += "{" * (underlined and not was) + "}" * (was and not underlined)
    return plain


class Terminal:
    """A shell in a terminal of tmux."""

    def __init__(self, directory, columns, rows):
        self.call = ["tmux", "-u", "-f", "/dev/null", "-S",
                     str(directory / f"tmux{columns}")]
        self.tmux("new-session", "-d", "-x", str(columns), "-y", str(rows), "sh")

    def tmux(self, *arguments):
        return subprocess.run([*self.call, *arguments], env=ENVIRONMENT, capture_output=True,
                              encoding="utf-8", check=True).stdout

    def press(self, *keys):
        if keys:
            self.tmux("send-keys", *keys)

    def enter(self, line):
        self.tmux("send-keys", "-l", line)
        self.press("Enter")

    def screen(self):
        """As it is, without the figure of the last key's time."""
        lines = without_styles(self.tmux("capture-pane", "-e", "-p")).split("\n")
        return "\n".join(re.sub(r" +\d+ µs$", " (time)", line.rstrip()) for line in lines).rstrip()

    def wait(self, condition, wanted=""):
        """The screen as soon as it fulfils the condition."""
        end = time.monotonic() + PATIENCE
        while not condition(screen := self.screen()):
            if time.monotonic() > end:
                raise AssertionError(f"the screen is\n{screen}\nand not\n{wanted}")
            time.sleep(0.02)
        return screen

    def wait_to_be(self, wanted):
        return self.wait(lambda screen: screen == wanted, wanted)

    def wait_for(self, pattern):
        return self.wait(lambda screen: re.search(pattern, screen, re.MULTILINE), pattern)

    def close(self):
        subprocess.run([*self.call, "kill-server"], capture_output=True, check=False)


class TypeTest(ToolCase):
    """A terminal where the sample is typed at."""

    def open(self, columns=80, rows=24, *arguments):
        """A terminal where the tool runs, in a shell that noted the state of the terminal."""
        self.terminal = Terminal(self.root, columns, rows)
        self.addCleanup(self.terminal.close)
        self.terminal.enter(f"PS1='{PROMPT} '; cd {shlex.quote(str(self.root))}; stty -g >before;"
                            " clear")
        self.terminal.wait(lambda screen: screen == PROMPT)
        self.start(*arguments)
        return self.terminal

    def start(self, *arguments):
        call = shlex.join(self.call("type", *arguments))
        (self.root / "run").write_text(f"echo $$ >pid; exec {call}\n")
        self.terminal.enter("sh run")
        self.terminal.wait_for("^(abc|123)> ")

    def assert_left_as_it_was(self, status):
        """The shell is back with the screen and the state of before, and the exit status."""
        self.terminal.wait_for(rf"^{PROMPT} sh run\n(.*\n)*{PROMPT}$")
        self.terminal.enter("echo status $?; stty -g >after")
        self.terminal.wait_for(rf"^status {status}\n{PROMPT}$")
        self.assertEqual(*((self.root / name).read_text() for name in ("before", "after")))


def recorded(columns, rows):
    """The recorded screens of a size by name."""
    text = (SCREENS / f"{columns}x{rows}.txt").read_text(encoding="utf-8")
    parts = re.split(r"(?m)^===== (.*)\n", text)
    return {name: screen.rstrip() for name, screen in zip(parts[1::2], parts[2::2])}


class ScreenTest(TypeTest):
    @unittest.skipUnless(RECORD, "the screens are compared")
    def test_record(self):
        for columns, rows in SIZES:
            terminal, screens = self.open(columns, rows), {}
            for keys, name in SCENARIO:
                terminal.press(*keys)
                while terminal.screen() != screens.get(name):
                    screens[name] = terminal.screen()
                    time.sleep(1)
            terminal.press("Escape")
            (SCREENS / f"{columns}x{rows}.txt").write_text(
                "".join(f"===== {name}\n{screen}\n" for name, screen in screens.items()),
                encoding="utf-8")

    def test_every_size(self):
        for columns, rows in SIZES:
            terminal, screens = self.open(columns, rows), recorded(columns, rows)
            for keys, name in SCENARIO:
                terminal.press(*keys)
                terminal.wait_to_be(screens[name])
            terminal.press("Escape")
            self.assert_left_as_it_was(0)
            terminal.close()

    def test_the_picture_in_the_readme(self):
        readme = (SCREENS.parents[2] / "README.md").read_text(encoding="utf-8")
        pictures = [re.sub(r" +\d+ µs$", " (time)", part).strip() for part in readme.split("```")]
        self.assertIn(recorded(*SIZES[0])["zhangs"], pictures)

    def test_follows_the_size_of_the_terminal(self):
        terminal = self.open(*SIZES[1])
        terminal.press(*"zhangs")
        for columns, rows in [SIZES[2], SIZES[0], SIZES[1]]:
            terminal.tmux("resize-window", "-x", str(columns), "-y", str(rows))
            terminal.wait_to_be(recorded(columns, rows)["zhangs"])
        terminal.tmux("resize-window", "-x", "39", "-y", "12")
        terminal.wait_to_be("needs 40 x 12")


class KeysTest(TypeTest):
    def test_picking_replaces_all_letters_of_the_character(self):
        table = pathlib.Path(PYFILE).read_bytes()
        words = [table[i:i + 3].decode() for i in range(0, len(table), 46)]
        self.sql("UPDATE localizer SET display_name = '南王', localizerkey = ? WHERE "
                 "contact_id = 54", "".join(chr(0x1000 + words.index(word)) for word in "南王"))
        self.run_tool("notify", "contacts", "54")
        terminal = self.open()
        terminal.press(*"nan")
        terminal.wait_for(r"^abc> nan (.*\n)*1南$")
        terminal.press("1")
        self.assertIn("> {南}王", terminal.wait_for("^abc> 南 "))
        terminal.press("9")
        terminal.wait_for("no character has this number")
        terminal.press(*"w", "BSpace", "BSpace")
        terminal.wait_for("^abc> nan ")

    def test_enter_prints_the_contact_that_is_selected(self):
        terminal = self.open(80, 24, "--starred")
        terminal.press(*"zs", "F2", "Down")
        chosen = self.search("zs")["matches"][1]
        terminal.wait_for(rf"^abc> zs (.*\n)*> .* {chosen['contact_id']}\n(.*\n)*F2\[ \]")
        terminal.press("Enter")
        terminal.wait_for(rf"^{chosen['contact_id']} +{chosen['name']}$")
        self.assert_left_as_it_was(0)
        # The result goes where the standard output goes, while the typing stays visible.
        (self.root / "run").write_text(
            f"echo \"id $({shlex.join(self.call('type'))} | cut -f 1)\"\n")
        terminal.enter("clear; sh run")
        terminal.wait_for("^abc> ")
        terminal.press(*"qqq", "Enter")
        terminal.wait_for("nobody to choose")
        terminal.press(*["BSpace"] * 3, *"zhangsan", "Enter")
        terminal.wait_for(rf"^id {self.search('zhangsan')['matches'][0]['contact_id']}$")


class SignalTest(TypeTest):
    def test_signals_leave_the_terminal_as_it_was(self):
        terminal = self.open()
        for ending in (signal.SIGTERM, signal.SIGHUP, signal.SIGINT, "C-c"):
            terminal.press(*"zhan")
            terminal.wait_for("^abc> zhan ")
            if ending == "C-c":
                terminal.press("C-c")
                ending = signal.SIGINT
            else:
                os.kill(int((self.root / "pid").read_text()), ending)
            self.assert_left_as_it_was(128 + ending)
            terminal.enter("clear")
            terminal.wait_to_be(PROMPT)
            self.start()

    def test_stops_and_goes_on(self):
        terminal = self.open()
        terminal.press(*"zhan")
        whole = r"(?s)\Aabc> zhan .*  丁\{子涵\} .*^1长 2张 3章 4行 5涵$.* Esc end \(time\)\Z"
        terminal.wait_for(whole)
        terminal.press("C-z")
        self.assert_left_as_it_was(128 + signal.SIGTSTP)
        terminal.enter("fg")
        terminal.wait_for(whole)
        terminal.press("g")
        terminal.wait_for("^abc> zhang ")


class IndexTest(TypeTest):
    def test_follows_changes_of_other_processes(self):
        terminal = self.open()
        terminal.press(*"zhangsan")
        terminal.wait_for("^abc> zhangsan .* 4 contacts$")
        # Twice in a row: the second change is seen too, however close it is to the first.
        for contact, count in ((54, 5), (55, 6)):
            self.sql("UPDATE localizer SET (display_name, localizerkey) = (SELECT '张' || "
                     "char(27) || '[31m三' || char(128512), localizerkey FROM localizer WHERE "
                     "contact_id = 1) WHERE contact_id = ?", contact)
            self.run_tool("notify", "contacts", contact)
            terminal.wait_for(rf"^abc> zhangsan .* {count} contacts$")
        terminal.wait_for(re.escape("{张\\x1b}[31m三\U0001f600"))
        terminal.press("BSpace")  # every text before it is searched anew, too
        terminal.wait_for(rf"^abc> zhangsa .* {self.search('zhangsa')['total']} contacts$")
        terminal.press("F2")
        before = self.search("zhangsa", "--starred")["total"]
        terminal.wait_for(rf"^abc> zhangsa .* {before} contacts?$")
        self.run_tool("notify", "star", "6")
        terminal.wait_for(rf"^abc> zhangsa .* {before + 1} contacts?$")


class RefusalTest(TypeTest):
    def test_where_it_cannot_run(self):
        self.refused(USAGE, "no terminal", "type", stdin=subprocess.DEVNULL)
        terminal = self.open()
        terminal.press("Escape")
        for setting, text in (("LC_ALL=C", "UTF-8"), ("TERM=dumb", "dumb"), ("TERM=", "TERM"),
                              ("TERM=none", "none")):
            terminal.enter(f"clear; {setting} {shlex.join(self.call('type'))}; echo status $?")
            self.assertIn(text, terminal.wait_for(rf"^status {USAGE}$"), setting)


if __name__ == "__main__":
    if shutil.which("tmux") is None:
        print("tmux is not installed: nothing is typed")
        sys.exit(SKIPPED)
    unittest.main(argv=[sys.argv[0], *(name for name in sys.argv[3:] if name != "--record")])
