"""Types random passwords into a password field of a browser, and looks for their characters in what was recorded."""

import random
import shutil
import signal
import string
import subprocess
import time

from check import Result
from Checks.screen_sync import use_desk

PAGE = "data:text/html,<title>Form</title><input type=password autofocus style='font-size:40px'><br><input>"
SECRET = string.ascii_uppercase + string.digits  # what is typed openly has small letters alone
OPEN = "plain text"


def open_browser(desk):
    bus = desk.start(["dbus-daemon", "--session", "--print-address", "--nofork"], stdout=subprocess.PIPE, text=True)
    desk.environment.update(DBUS_SESSION_BUS_ADDRESS=bus.stdout.readline().strip(), ACCESSIBILITY_ENABLED="1")
    desk.start(["chromium", "--no-sandbox", "--force-renderer-accessibility", "--disable-gpu", "--no-first-run",
                f"--user-data-dir={desk.folder}/profile", f"--app={PAGE}", "--window-size=800,500"])
    desk.wait_for(lambda: "Form" in desk.xdotool("getactivewindow", "getwindowname"), 60)
    time.sleep(4)  # its accessible objects come later than its window


def type_into_both(desk, entries, result):
    """The password field has the focus before and afterwards."""
    for _ in range(entries):
        desk.xdotool("type", "--delay", "15", "".join(random.choices(SECRET, k=8)))
        result.cases += 1
        if random.random() < 0.1:
            desk.xdotool("key", "Tab")
            time.sleep(0.6)
            desk.xdotool("type", "--delay", "30", OPEN)
            time.sleep(0.6)
            desk.xdotool("key", "shift+Tab")
            time.sleep(random.uniform(0, 0.3))


def start(desk, mode, name):
    """The bus has to answer within 2 seconds, which a machine with other work to do may miss at first."""
    for _ in range(5):
        recording = desk.record("--keys", mode, name=name)
        if recording.process.poll() is None:
            return recording
    raise RuntimeError(recording.errors())


def look(found, result, where):
    typed = [chr(entry.value[0]) for entry in found.get("keyboardAction", []) if entry.value[0] < 0x110000]
    leaked = [key for key in typed if key in SECRET]
    if leaked:
        result.lost += 1
        result.failures.append(f"{where}: {len(leaked)} characters of passwords are recorded")
    return "".join(typed).count(OPEN[0])


def run(context):
    modules = use_desk(context)
    result = Result()
    if not shutil.which("chromium"):
        result.failures.append("there is no chromium; 'scripts/install.sh browser' installs it")
        return result
    opened = 0
    entries = 250 if context.full else 8
    for number, (mode, end) in enumerate([("all", signal.SIGTERM), ("shortcuts", signal.SIGTERM),
                                          ("all", signal.SIGKILL), ("shortcuts", signal.SIGKILL)]):
        with modules[0].Desk() as desk:
            open_browser(desk)
            recording = start(desk, mode, f"run{number}.mp4")
            time.sleep(1)
            type_into_both(desk, entries, result)
            desk.xdotool("key", "Tab")
            time.sleep(0.6)
            desk.xdotool("type", "--delay", "30", OPEN)
            time.sleep(1.5)
            recording.process.send_signal(end)
            recording.process.wait(60)
            killed = end == signal.SIGKILL
            found = modules[1].streams_of_folder(recording.folder) if killed else \
                modules[1].streams_of_movie(recording.output)
            opened += look(found, result, f"--keys {mode}, {end.name}")
    if opened == 0:
        result.failures.append("what was typed openly is not recorded either, so nothing was proven")
    return result
