"""Draws where the cursor was, and for how long, over the recorded region: heat_map.py RECORDING PICTURE"""

# %% What was recorded
import sys

import matplotlib

matplotlib.use("Agg")  # draws into files, without a screen
import matplotlib.pyplot as plt
import numpy as np
import zulmetadata

recording = zulmetadata.Recording(sys.argv[1])
cursor = recording["cursorLocation"]
clicks = recording["cursorAction"]
region = recording["recordingRegion"][-1]

# %% How long the cursor stayed at each place: until the next position came
seconds = np.diff(cursor["time"], append=max(recording.duration or 0, cursor["time"][-1]))
left, top, width, height = (int(region[name]) for name in ("x", "y", "width", "height"))
heat, rows, columns = np.histogram2d(
    cursor["y"], cursor["x"], bins=(18, 32), range=((top, top + height), (left, left + width)), weights=seconds)

# %% Where it was clicked: the last position in front of each click
pressed = clicks[np.isin(clicks["rawActionValue"] & 0x3F, (1, 4))]
nearest = np.searchsorted(cursor["time"], pressed["time"], side="right") - 1
places = cursor[nearest[nearest >= 0]]

# %% The picture
figure, axes = plt.subplots(figsize=(9.6, 5.4), dpi=100, layout="constrained")
shown = axes.imshow(heat, extent=(left, left + width, top + height, top), cmap="magma", interpolation="bilinear")
axes.scatter(places["x"], places["y"], s=60, facecolors="none", edgecolors="white")
axes.set_title(f"{len(cursor)} positions in {cursor['time'][-1]:.0f} s, and {len(places)} clicks")
axes.set_axis_off()
figure.colorbar(shown, label="seconds", shrink=0.8)
figure.savefig(sys.argv[2])
print(f"{heat.sum():.1f} s over the region, {len(places)} clicks")
