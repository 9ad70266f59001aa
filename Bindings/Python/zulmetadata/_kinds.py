"""The names of the kinds that have entries, as a type."""

from typing import Literal

Kind = Literal[
    "cursorAction",
    "cursorImage",
    "cursorLocation",
    "cursorOpacity",
    "keyboardAction",
    "recordingRegion",
    "topmostWindow",
    "slideTitles",
    "slideText",
    "slideComment",
    "recordingScaleFactor",
    "systemData",
    "scrollAction",
    "topmostAppName",
    "topmostWindowTitle",
    "cpuUsage",
    "hoverRect",
]
