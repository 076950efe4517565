"""Transcripts: calls in a shell, each behind a dollar sign, and below each what it prints: standard
output, error output behind exclamation marks, and an exit code that is not 0."""
import os
import re
import subprocess
import sys

RECORD = "--record" in sys.argv  # anew, for people to look through


def check(case, path, directory, shell, **variables):
    """The calls of the file print in the directory what the file says. In front of each the shell's
    definitions are run."""
    recorded, printed = path.read_text(encoding="utf-8"), ""
    environment = {**os.environ, "TZ": "UTC", "LC_ALL": "C.UTF-8", "TERM": "xterm", "NO_COLOR": "",
                   **variables}
    for line in re.findall(r"(?m)^\$ (.*)$", recorded):
        process = subprocess.run(["bash", "-c", f"{shell}\n{line}"], cwd=directory, env=environment,
                                 capture_output=True, encoding="utf-8", check=False)
        errors = re.sub("(?m)^(?=.)", "! ", process.stderr)
        code = f"exit code {process.returncode}\n" if process.returncode else ""
        printed += f"$ {line}\n{process.stdout}{errors}{code}"
    for varying, shown in ((re.escape(str(directory)), "ROOT"), (r" +\d+ ms\n", " (time)\n"),
                           (r"hFile=\d+", "hFile=N")):
        printed = re.sub(varying, shown, printed)
    if RECORD:
        path.write_text(printed, encoding="utf-8")
    else:
        case.assertEqual(recorded, printed)
