"""Types random passwords into password fields of a browser and of a GTK application, and looks for their characters in
everything that was written."""

import random
import shutil
import signal
import string
import time

from check import Result
from Checks.screen_sync import use_desk

PAGE = "data:text/html,<title>Form</title><input type=password autofocus style='font-size:40px'><br><input>"
SECRET = string.ascii_uppercase + string.digits  # what is typed openly has small letters alone
OPEN = "plain text"
MODES = ("all", "shortcuts", "none")


def open_browser(desk):
    desk.environment["ACCESSIBILITY_ENABLED"] = "1"
    desk.start(["chromium", "--no-sandbox", "--force-renderer-accessibility", "--disable-gpu", "--no-first-run",
                f"--user-data-dir={desk.profile}", f"--app={PAGE}", "--window-size=800,500"])
    desk.wait_for(lambda: "Form" in desk.xdotool("getactivewindow", "getwindowname"), 60)
    time.sleep(4)  # its accessible objects come later than its window


def open_form(desk):
    if not desk.open_form():
        raise RuntimeError("GTK for Python is missing; 'scripts/install.sh desktop' installs it")
    desk.wait_for(lambda: "Form" in desk.xdotool("getactivewindow", "getwindowname"), 60)


APPLICATIONS = {"GTK": open_form, "Chromium": open_browser}


def type_into_both(desk, entries, result):
    """The password field has the focus before and afterwards. Returns the passwords."""
    passwords = []
    for _ in range(entries):
        passwords.append("".join(random.choices(SECRET, k=8)))
        desk.xdotool("type", "--delay", "15", passwords[-1])
        result.cases += 1
        if random.random() < 0.1:
            desk.xdotool("key", "Tab")
            time.sleep(0.6)
            desk.xdotool("type", "--delay", "30", OPEN)
            time.sleep(0.6)
            desk.xdotool("key", "shift+Tab")
            time.sleep(random.uniform(0, 0.3))
    return passwords


def look_at_keys(found, result, where):
    """Returns how often something is recorded that was typed openly."""
    typed = [chr(entry.value[0]) for entry in found.get("keyboardAction", []) if entry.value[0] < 0x110000]
    leaked = [key for key in typed if key in SECRET]
    if leaked:
        result.lost += 1
        result.failures.append(f"{where}: {len(leaked)} characters of passwords are recorded")
    return "".join(typed).count(OPEN[0])


def look_at_disk(folder, passwords, result, where):
    """Whether a password is in any file, as text of 8, 16 or 32 bits. The field shows none, so no picture has one."""
    for file in folder.rglob("*"):
        if not file.is_file() or file.is_symlink():
            continue
        contents = file.read_bytes()
        found = [password for password in passwords for encoding in ("ascii", "utf-16-le", "utf-32-le")
                 if password.encode(encoding) in contents]
        if found:
            result.lost += 1
            result.failures.append(f"{where}: {file.name} holds {len(found)} passwords")


def record_passwords(modules, application, mode, number, entries, result):
    """Returns how much of what was typed openly is recorded."""
    where = f"{application}, --keys {mode}, {number.name}"
    with modules[0].Desk() as desk:
        desk.start_bus()
        desk.profile = desk.folder.with_name(desk.folder.name + "-profile")  # not among what the recorder writes
        try:
            APPLICATIONS[application](desk)
            recording = desk.record_with_bus(mode, "run.mp4")
            time.sleep(1)
            passwords = type_into_both(desk, entries, result)
            desk.xdotool("key", "Tab")
            time.sleep(0.6)
            desk.xdotool("type", "--delay", "30", OPEN)
            time.sleep(1.5)
            recording.process.send_signal(number)
            recording.process.wait(60)
            look_at_disk(desk.folder, passwords, result, where)
            is_killed = number == signal.SIGKILL
            found = modules[1].streams_of_folder(recording.folder) if is_killed else \
                modules[1].streams_of_movie(recording.output)
            return look_at_keys(found, result, where)
        finally:
            shutil.rmtree(desk.profile, ignore_errors=True)


def run(context):
    modules = use_desk(context)
    result = Result()
    if not shutil.which("chromium"):
        result.failures.append("there is no chromium; 'scripts/install.sh browser' installs it")
        return result
    endings = (signal.SIGTERM, signal.SIGKILL)
    runs = [(mode, number) for mode in MODES for number in endings] if context.full else [("all", signal.SIGKILL)]
    entries = 1000 // len(runs) + 1 if context.full else 24
    result.notes.append("| passwords typed into | entries | runs | recorded characters of them | open texts recorded |")
    for application in APPLICATIONS if context.full else ("GTK",):
        earlier = result.cases, result.lost
        opened = sum(record_passwords(modules, application, mode, number, entries, result) for mode, number in runs)
        lost = result.lost - earlier[1]
        result.notes.append(f"| {application} | {result.cases - earlier[0]} | {len(runs)} | "
                            f"{'none' if lost == 0 else f'in {lost} runs'} | {opened} |")
        if opened == 0:
            result.failures.append(f"{application}: what was typed openly is not recorded either: nothing was proven")
    return result
