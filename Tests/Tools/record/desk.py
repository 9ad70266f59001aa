"""A desk to record: an X server of its own, a window manager, and the window of ShownWindow.cpp."""

import os
import pathlib
import shutil
import signal
import subprocess
import tempfile
import time

from streams import streams_of_folder

PROGRAMS = {"recorder": os.environ.get("ZULM_RECORD", ""), "window": os.environ.get("SHOWN_WINDOW", ""),
            "zulm": os.environ.get("ZULM", "")}


def end(process, number=signal.SIGTERM):
    if process.poll() is None:
        process.send_signal(number)
        try:
            process.wait(10)
        except subprocess.TimeoutExpired:
            process.kill()
            process.wait()


class Desk:
    """What runs on one X display. Everything ends with it."""

    def __init__(self, size="1280x720x24", manager="openbox", layout=None, server=()):
        self.folder = pathlib.Path(tempfile.mkdtemp(prefix="zulm-desk-"))
        self.processes = []
        read, write = os.pipe()
        self.environment = {name: value for name, value in os.environ.items()
                            if name not in ("DBUS_SESSION_BUS_ADDRESS", "AT_SPI_BUS_ADDRESS", "WAYLAND_DISPLAY")}
        self.environment.update(HOME=str(self.folder), XDG_RUNTIME_DIR=str(self.folder), LC_ALL="C.UTF-8")
        self.server = self.start(["Xvfb", "-displayfd", str(write), "-screen", "0", size, "-nolisten", "tcp",
                                  "-noreset", *server], pass_fds=[write])
        os.close(write)
        with os.fdopen(read) as numbers:
            number = numbers.readline().strip()
        if not number:
            raise OSError("Xvfb has ended at once")
        self.display = f":{number}"
        self.environment["DISPLAY"] = self.display
        if layout:
            self.run("setxkbmap", *layout)
        if manager:
            self.start([manager])
            self.wait_for(lambda: "window id" in self.run("xprop", "-root", "_NET_SUPPORTING_WM_CHECK"))

    def __enter__(self):
        return self

    def __exit__(self, *_):
        for process in reversed(self.processes):
            end(process)
            for pipe in (process.stdin, process.stdout):
                if pipe:
                    pipe.close()
        shutil.rmtree(self.folder, ignore_errors=True)

    def start(self, command, **options):
        environment = options.pop("env", None)
        options.setdefault("stdout", subprocess.DEVNULL)
        options.setdefault("stderr", subprocess.DEVNULL)
        process = subprocess.Popen(command, env=environment or self.environment, cwd=self.folder, **options)
        self.processes.append(process)
        return process

    def run(self, *command, **options):
        options.setdefault("timeout", 60)
        return subprocess.run(command, env=self.environment, cwd=self.folder, stdout=subprocess.PIPE, text=True,
                              stderr=subprocess.STDOUT, check=False, **options).stdout

    def xdotool(self, *words):
        return self.run("xdotool", *[str(word) for word in words])

    @staticmethod
    def wait_for(holds, seconds=60):
        until = time.monotonic() + seconds
        while not holds():
            if time.monotonic() > until:
                raise TimeoutError("what was waited for did not happen")
            time.sleep(0.02)

    def show(self, *geometry, managed=True):
        window = Window(self, geometry or (200, 100, 800, 500), managed)
        return window

    def start_bus(self):
        """A session bus, by which applications and the recorder find the accessibility bus."""
        bus = self.start(["dbus-daemon", "--session", "--print-address", "--nofork"], stdout=subprocess.PIPE, text=True)
        self.environment["DBUS_SESSION_BUS_ADDRESS"] = bus.stdout.readline().strip()

    def start_sound(self):
        """A sound server whose only device is silent; what is played there can be recorded."""
        self.start(["pulseaudio", "-n", "--daemonize=no", "--exit-idle-time=-1", "--use-pid-file=no",
                    "--load=module-native-protocol-unix", "--load=module-null-sink sink_name=desk"])
        self.wait_for(lambda: "desk.monitor" in self.run("pactl", "list", "short", "sources"))

    def open_form(self):
        """The window of form.py. Returns where its fields are, by their names."""
        form = self.start(["/usr/bin/python3", os.path.join(os.path.dirname(__file__), "form.py")], stdout=subprocess.PIPE,
                          text=True)
        words = [form.stdout.readline().split() for _ in range(3)]
        return {word[1]: tuple(int(number) for number in word[2:]) for word in words if word}

    def record(self, *options, name="out.mp4", wait=True):
        return Recording(self, self.folder / name, options, wait)

    def record_with_bus(self, mode, name="out.mp4"):
        """The bus has to answer within 2 seconds, which a machine with other work to do may miss at first."""
        for _ in range(5):
            recording = self.record("--keys", mode, name=name)
            if recording.process.poll() is None:
                return recording
        raise RuntimeError(recording.errors())


class Window:
    def __init__(self, desk, geometry, managed):
        self.desk = desk
        self.log = desk.folder / f"window-{len(desk.processes)}.log"
        with open(self.log, "w", encoding="utf-8") as output:
            self.process = desk.start([PROGRAMS["window"], *[str(number) for number in geometry],
                                       *([] if managed else ["unmanaged"])], stdin=subprocess.PIPE, stdout=output,
                                      text=True)
        desk.wait_for(lambda: self.lines("window"))
        self.id = int(self.lines("window")[0][0])
        if managed:
            desk.wait_for(self.is_active)
        time.sleep(0.2)

    def is_active(self):
        """Asks for it: a manager that has just started leaves the focus where it is."""
        if f"{self.id:x}" in self.desk.run("xprop", "-root", "_NET_ACTIVE_WINDOW"):
            return True
        self.desk.xdotool("windowactivate", self.id)
        return False

    def lines(self, kind):
        """The words after `kind` of the lines that the window has printed."""
        words = [line.split() for line in self.log.read_text(encoding="utf-8").splitlines()]
        return [line[1:] for line in words if line and line[0] == kind]

    def tell(self, line):
        """Text is sent as UTF-8, bytes as they are."""
        self.process.stdin.buffer.write((line if isinstance(line, bytes) else line.encode()) + b"\n")
        self.process.stdin.buffer.flush()

    def tell_and_wait(self, line, answer):
        """Waits until the window says that the server has done it."""
        before = len(self.lines(answer))
        self.tell(line)
        self.desk.wait_for(lambda: len(self.lines(answer)) > before)

    def grab_keyboard(self):
        self.tell_and_wait("grab", "grabbed")

    def ungrab_keyboard(self):
        self.tell_and_wait("ungrab", "ungrabbed")


class Recording:
    def __init__(self, desk, output, options, wait):
        self.desk = desk
        self.output = output
        self.folder = output.with_name(output.name + ".recording")
        self.log = desk.folder / f"recorder-{len(desk.processes)}.log"
        self.json = self.log.with_suffix(".json")
        with open(self.log, "w", encoding="utf-8") as errors, open(self.json, "w", encoding="utf-8") as document:
            self.process = desk.start([PROGRAMS["recorder"], "-o", str(output), "--json", *options], stdout=document,
                                      stderr=errors)
        if wait:
            desk.wait_for(lambda: f"recording {output}" in self.errors() or self.process.poll() is not None)

    def entries(self, kind):
        """The entries of a kind that are in the file by now."""
        return streams_of_folder(self.folder).get(kind, [])

    def errors(self):
        return self.log.read_text(encoding="utf-8")

    def stop(self, number=signal.SIGTERM):
        """Ends the recording, and returns how the recorder ended. What was done just before is part of it."""
        time.sleep(0.4)
        self.process.send_signal(number)
        return self.process.wait(60)

    def socket(self):
        """Where the recorder listens, which is the only one."""
        [only] = [path for path in self.desk.folder.iterdir() if path.is_socket() and "zulm-record-" in path.name]
        return only

    def control(self, word):
        return self.desk.run(PROGRAMS["recorder"], word)


def processes_of(process):
    """The numbers of the processes that a process has started."""
    return [int(number) for number in
            subprocess.run(["pgrep", "-P", str(process.pid)], capture_output=True, text=True, check=False).stdout.split()]


def probe(path, *show):
    command = ["ffprobe", "-v", "error", "-of", "csv=p=0", *show, str(path)]
    return subprocess.run(command, capture_output=True, text=True, check=True, timeout=60).stdout.splitlines()


def frame_times(path):
    return [float(line.split(",")[0]) for line in
            probe(path, "-select_streams", "v", "-show_entries", "packet=pts_time") if line]


def colour_index(pixel):
    """Returns which of the eight colours of the window's strip this is."""
    if all(90 < channel < 170 for channel in pixel):
        return 7
    red, green, blue = (channel > 170 for channel in pixel)
    return red << 2 | green << 1 | blue


def grey_frames(path, area):
    """The brightness of the pixels of an area, frame by frame."""
    x, y, width, height = area
    command = ["ffmpeg", "-v", "error", "-i", str(path), "-vf", f"crop={width}:{height}:{x}:{y}", "-fps_mode",
               "passthrough", "-f", "rawvideo", "-pix_fmt", "gray", "-"]
    with subprocess.Popen(command, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL) as process:
        while len(frame := process.stdout.read(width * height)) == width * height:
            yield frame
        process.stdout.close()


def pixels(path, area, size=None):
    """The pixels of an area of each frame, red, green and blue, perhaps shrunk to `size`."""
    x, y, width, height = area
    columns, rows = size or (width, height)
    filters = f"crop={width}:{height}:{x}:{y}" + (f",scale={columns}:{rows}:flags=area" if size else "")
    command = ["ffmpeg", "-v", "error", "-i", str(path), "-vf", filters, "-fps_mode", "passthrough", "-f", "rawvideo",
               "-pix_fmt", "rgb24", "-"]
    data = subprocess.run(command, capture_output=True, check=True, timeout=300).stdout
    length = columns * rows * 3
    return [data[start:start + length] for start in range(0, len(data), length)]
