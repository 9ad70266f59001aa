"""Draws where the cursor was, and for how long, over the recorded region, with a circle around each click."""

# %% What was recorded
import argparse
import sys

import matplotlib

matplotlib.use("Agg")  # draws into files, without a screen
import matplotlib.pyplot as plt
import numpy as np
import zulmetadata

LEFT_DOWN, RIGHT_DOWN = 1, 4  # the bits that zulmetadata.action_text turns into texts

parser = argparse.ArgumentParser(description=__doc__)
parser.add_argument("recording", metavar="RECORDING")
parser.add_argument("picture", metavar="PICTURE")
arguments = parser.parse_args()

try:
    recording = zulmetadata.Recording(arguments.recording)
except (OSError, ValueError) as error:
    sys.exit(str(error))


def recorded(kind, least):
    entries = recording.get(kind)
    if entries is None or len(entries) < least:
        sys.exit(f"{arguments.recording}: there is no {kind} in it")
    return entries


cursor = recorded("cursorLocation", least=1)
clicks = recorded("cursorAction", least=0)
region = recorded("recordingRegion", least=1)[-1]

# %% How long the cursor stayed at each place: until the next position
seconds = np.diff(cursor["time"], append=max(recording.duration or 0, cursor["time"][-1]))
left, top, width, height = (int(region[name]) for name in ("x", "y", "width", "height"))
heat, rows, columns = np.histogram2d(
    cursor["y"], cursor["x"], bins=(18, 32), range=((top, top + height), (left, left + width)), weights=seconds)

# %% Where the clicks were: the last position before each click
pressed = clicks[clicks["rawActionValue"] & (LEFT_DOWN | RIGHT_DOWN) != 0]
nearest = np.searchsorted(cursor["time"], pressed["time"], side="right") - 1
places = cursor[nearest[nearest >= 0]]

# %% The picture
figure, axes = plt.subplots(figsize=(9.6, 5.4), dpi=100, layout="constrained")
shown = axes.imshow(heat, extent=(left, left + width, top + height, top), cmap="magma", interpolation="bilinear")
axes.scatter(places["x"], places["y"], s=60, facecolors="none", edgecolors="white")
axes.set_title(f"{len(cursor)} positions in {cursor['time'][-1]:.0f} s, and {len(places)} clicks")
axes.set_axis_off()
figure.colorbar(shown, label="seconds", shrink=0.8)
figure.savefig(arguments.picture)
print(f"{heat.sum():.1f} s over the region, {len(places)} clicks")
