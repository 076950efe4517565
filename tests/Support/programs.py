"""Programs that tests run."""
import subprocess


def run(*command, **options):
    """What the program prints; where it fails, the test's failure shows that with its errors."""
    process = subprocess.run([str(word) for word in command], capture_output=True,
                             encoding="utf-8", check=False, **options)
    assert process.returncode == 0, f"{command}\n{process.stdout}{process.stderr}"
    return process.stdout
