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
import sys
import time

sys.path.insert(0, str(pathlib.Path(__file__).parents[1] / "Support"))
# pylint: disable=wrong-import-position
import tool_case
from programs import run
from tool_case import SKIPPED, ToolCase
from transcript import RECORD

SCREENS = pathlib.Path(__file__).parent / "screens"
SIZES = [(40, 12), (80, 24), (132, 43)]
ZHANGS = "Home z h a n g s"
PROMPT = "shell>"
PATIENCE = 60  # seconds until a screen that does not come is a failure
ENVIRONMENT = {**os.environ, "LC_ALL": "C.UTF-8"}
ENVIRONMENT.pop("TMUX", None)


def without_styles(text):
    """The text of a screen with underlined characters in braces: those that matched."""
    style = r"\x1b\[[\d;]*m"
    braced = re.sub(rf"\x1b\[(?:\d+;)*4(?:;\d+)*m(?:{style})*([^\x1b]+)", r"{\1}", text)
    return re.sub(style, "", braced)


class TypeTest(ToolCase):
    """The sample is typed at in a terminal of tmux, in a shell that noted the terminal's state."""

    def setUp(self):
        super().setUp()
        self.tmux("new-session", "-d", "-x", "80", "-y", "24", "sh")
        self.addCleanup(self.tmux, "kill-server")
        self.enter(f"PS1='{PROMPT} '; cd {shlex.quote(str(self.root))}; stty -g >before")
        self.clear()

    def tmux(self, *arguments):
        return run("tmux", "-u", "-f", "/dev/null", "-S", self.root / "tmux", *arguments,
                   env=ENVIRONMENT)

    def resize(self, columns, rows):
        self.tmux("resize-window", "-x", str(columns), "-y", str(rows))

    def press(self, *keys):
        if keys:
            self.tmux("send-keys", *keys)

    def enter(self, line):
        self.tmux("send-keys", "-l", line)
        self.press("Enter")

    def clear(self):
        self.enter("clear")
        self.wait_to_be(PROMPT)

    def start(self, *arguments):
        call = shlex.join(self.call("type", *arguments))
        (self.root / "run").write_text(f"echo $$ >pid; exec {call}\n")
        self.enter("sh run")
        self.wait_for("^(abc|123)> ")

    def screen(self):
        """As it is, without the figure of the last key's time."""
        lines = without_styles(self.tmux("capture-pane", "-e", "-p")).split("\n")
        return "\n".join(re.sub(r" +\d+ µs$", " (time)", line.rstrip()) for line in lines).rstrip()

    def wait_to_be(self, wanted):
        self.wait_for(rf"\A{re.escape(wanted)}\Z")

    def wait_for(self, pattern):
        """The screen as soon as the pattern is on it."""
        end = time.monotonic() + PATIENCE
        while not re.search(pattern, screen := self.screen(), re.MULTILINE):
            self.assertLess(time.monotonic(), end, f"the screen is\n{screen}\nand not\n{pattern}")
            time.sleep(0.02)
        return screen

    def assert_left_as_it_was(self, status):
        """The shell is back with the screen and the state of before, and the exit status."""
        self.wait_for(rf"^{PROMPT} sh run\n(.*\n)*{PROMPT}$")
        self.enter("echo status $?; stty -g >after")
        self.wait_for(rf"^status {status}\n{PROMPT}$")
        self.assertEqual(*((self.root / name).read_text() for name in ("before", "after")))


def file_of(columns, rows):
    return SCREENS / f"{columns}x{rows}.txt"


def recorded(columns, rows):
    """The screens of a size by the keys that bring them, which stand behind five signs."""
    parts = re.split(r"(?m)^===== ?(.*)\n", file_of(columns, rows).read_text(encoding="utf-8"))
    return {keys: screen.rstrip() for keys, screen in zip(parts[1::2], parts[2::2])}


class ScreenTest(TypeTest):
    def test_every_size(self):
        for size in SIZES:
            self.resize(*size)
            self.clear()
            self.start()
            screens = recorded(*size)
            for keys in screens:
                self.press(*keys.split())
                while RECORD and self.screen() != screens[keys]:
                    screens[keys] = self.screen()
                    time.sleep(1)
                self.wait_to_be(screens[keys])
            self.press("Escape")
            self.assert_left_as_it_was(0)
            if RECORD:
                file_of(*size).write_text("".join(f"===== {keys}".rstrip() + f"\n{screen}\n"
                                                  for keys, screen in screens.items()))

    def test_the_picture_in_the_readme(self):
        readme = (SCREENS.parents[2] / "README.md").read_text(encoding="utf-8")
        pictures = [re.sub(r" +\d+ µs$", " (time)", part).strip() for part in readme.split("```")]
        self.assertIn(recorded(*SIZES[0])[ZHANGS], pictures)

    def test_follows_the_size_of_the_terminal(self):
        self.start()
        self.press(*"zhangs")
        for size in (SIZES[2], SIZES[0], SIZES[1]):
            self.resize(*size)
            self.wait_to_be(recorded(*size)[ZHANGS])
        self.resize(39, 12)
        self.wait_to_be("needs 40 x 12")


class KeysTest(TypeTest):
    def test_enter_prints_the_contact_that_is_selected(self):
        self.start("--starred")
        self.press(*"zs", "F2", "Down")
        chosen = self.search("zs")["matches"][1]
        self.wait_for(rf"^abc> zs (.*\n)*> .* {chosen['contact_id']}\n(.*\n)*F2\[ \]")
        self.press("Enter")
        self.wait_for(rf"^{chosen['contact_id']} +{chosen['name']}$")
        self.assert_left_as_it_was(0)
        # The result goes where the standard output goes, while the typing stays visible.
        (self.root / "run").write_text(
            f"echo \"id $({shlex.join(self.call('type'))} | cut -f 1)\"\n")
        self.enter("clear; sh run")
        self.wait_for("^abc> ")
        self.press(*"zhangsan", "Enter")
        self.wait_for(rf"^id {self.search('zhangsan')['matches'][0]['contact_id']}$")


class SignalTest(TypeTest):
    def test_signals_leave_the_terminal_as_it_was(self):
        self.start()
        for ending in (signal.SIGTERM, signal.SIGHUP, signal.SIGINT, "C-c"):
            self.press(*"zhan")
            self.wait_for("^abc> zhan ")
            if ending == "C-c":
                self.press("C-c")
                ending = signal.SIGINT
            else:
                os.kill(int((self.root / "pid").read_text()), ending)
            self.assert_left_as_it_was(128 + ending)
            self.clear()
            self.start()

    def test_stops_and_goes_on(self):
        self.start()
        self.press(*"zhan")
        whole = r"(?s)\Aabc> zhan .*  丁\{子涵\} .*^1长 2张 3章 4行 5涵$.* Esc end \(time\)\Z"
        self.wait_for(whole)
        self.press("C-z")
        self.assert_left_as_it_was(128 + signal.SIGTSTP)
        self.enter("fg")
        self.wait_for(whole)
        self.press("g")
        self.wait_for("^abc> zhang ")


class IndexTest(TypeTest):
    def test_follows_changes_of_other_processes(self):
        self.start()
        self.press(*"zhangsan")
        self.wait_for("^abc> zhangsan .* 4 contacts$")
        # Twice in a row: the second change is seen too, however close it is to the first.
        for contact, count in ((54, 5), (55, 6)):
            self.sql("UPDATE localizer SET (display_name, localizerkey) = (SELECT '张' || "
                     "char(27) || '[31m三' || char(128512), localizerkey FROM localizer WHERE "
                     "contact_id = 1) WHERE contact_id = ?", contact)
            self.run_tool("notify", "contacts", contact)
            self.wait_for(rf"^abc> zhangsan .* {count} contacts$")
        self.wait_for(re.escape("{张\\x1b}[31m三\U0001f600"))
        self.press("BSpace")  # every text before it is searched anew, too
        self.wait_for(rf"^abc> zhangsa .* {self.search('zhangsa')['total']} contacts$")
        self.press("F2")
        before = self.search("zhangsa", "--starred")["total"]
        self.wait_for(rf"^abc> zhangsa .* {before} contacts?$")
        self.run_tool("notify", "star", "6")
        self.wait_for(rf"^abc> zhangsa .* {before + 1} contacts?$")
        self.press("Escape")
        self.assert_left_as_it_was(0)


if __name__ == "__main__":
    if shutil.which("tmux") is None:
        print("tmux is not installed: nothing is typed")
        sys.exit(SKIPPED)
    tool_case.main()
