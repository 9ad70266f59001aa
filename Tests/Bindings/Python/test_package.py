import ast
import os
import pathlib
import re
import subprocess
import sys
import typing

import numpy as np
import zulmetadata
from conftest import PLAIN_MOVIE, sample_entries
from matplotlib import image

PROJECT = pathlib.Path(__file__).parents[3]


def test_version_is_the_projects():
    text = (PROJECT / "CMakeLists.txt").read_text()
    assert zulmetadata.__version__ == re.search(r"project\(ZULMetaData VERSION ([0-9.]+)", text).group(1)


def described(thing):
    """Whether there is a text, behind the signature that the core's functions begin with."""
    text = thing.__doc__ or ""
    if re.match(r"\w+\(.*\) -> ", text):
        text = text.partition("\n")[2]
    return text.strip() != ""


def public_things():
    for name in zulmetadata.__all__:
        thing = getattr(zulmetadata, name)
        if not isinstance(thing, str) and typing.get_origin(thing) is None:  # which cannot have a text
            yield name, thing
        if isinstance(thing, type):
            yield from ((f"{name}.{member}", getattr(thing, member)) for member in vars(thing)
                        if not member.startswith("_") and not isinstance(getattr(thing, member), str))


def test_everything_public_is_described():
    things = dict(public_things())
    assert {"verify", "Recording.container", "RecordedStream.read", "Finding.sentence"} <= things.keys()
    assert [name for name, thing in things.items() if not described(thing)] == []


def test_every_name_that_the_package_makes_is_exported_or_private():
    names = set()
    for node in ast.parse(pathlib.Path(zulmetadata.__file__).read_text()).body:
        names |= {getattr(node, "name", "_"), *(target.id for target in getattr(node, "targets", []))}
    assert {name for name in names if not name.startswith("_")} <= set(zulmetadata.__all__)


def run(module, *arguments, **environment):
    ended = subprocess.run([sys.executable, "-m", module, *arguments], capture_output=True, text=True,
                           env=os.environ | environment)
    assert ended.returncode == 0, ended.stdout + ended.stderr


def test_stubs_say_what_the_core_has(tmp_path):
    allowed = tmp_path / "allowed"  # the metaclass of pybind11, and constructors of what only the core makes
    allowed.write_text(r"zulmetadata\._core\.[A-Z]\w+" + "\n" + r"zulmetadata\._core\.[A-Z]\w+\.__init__" + "\n")
    run("mypy.stubtest", "--allowlist", str(allowed), "zulmetadata._core", MYPY_CACHE_DIR=str(tmp_path))


def test_the_package_is_typed(tmp_path):
    package = pathlib.Path(zulmetadata.__file__).parent
    run("mypy", "--strict", str(package), MYPY_CACHE_DIR=str(tmp_path))


CONSUMER = """
import pathlib

import numpy as np
import zulmetadata

zulmetadata.write_stream("a.dat", "slideTitles", [(0.0, "a")])
zulmetadata.write_stream(pathlib.Path("a.dat"), "cursorImage",
                         [(0.0, 1, 0, 0, 2, 3, b"image"), (1, 1, 0, 0, 2, 3, None)])
zulmetadata.write_stream("a.dat", "cursorLocation", [[0.0, 1, 2], [3.0, 4, 5]])
zulmetadata.write_stream("a.dat", "cursorLocation", np.zeros((2, 3)))
with zulmetadata.StreamWriter("a.dat", "cursorLocation") as writer:
    writer.append(0.25, 640, 360)
    writer.extend(zulmetadata.Recording("a.dat")["cursorLocation"][::2])
zulmetadata.attach("m.mp4", ["a.dat", pathlib.Path("b.dat"), *zulmetadata.Recording("c.mp4").streams])
zulmetadata.attach("m.mp4", zulmetadata.Recording("c.mp4"))
kind: zulmetadata.Kind = "cursorLocation"
with zulmetadata.Recording("c.mp4") as recording:
    for name, entries in recording.items():
        zulmetadata.write_stream("b.dat", name, (tuple(entry) for entry in entries.tolist()))
    print(recording[kind], zulmetadata.dtype_of(zulmetadata.recorded_kinds()[0]))
print(zulmetadata.SaveError("x").file.upper(), [finding.code for finding in zulmetadata.verify("m.mp4").findings])
"""


def test_the_type_of_a_kind_has_all_kinds():
    assert list(typing.get_args(zulmetadata.Kind)) == zulmetadata.recorded_kinds()


def test_the_readme_has_the_fields_of_every_kind():
    readme = (PROJECT / "Bindings" / "Python" / "README.md").read_text()
    rows = re.findall(r"^\| `(\w+)` \| (.*) \|$", readme, re.MULTILINE)
    expected = []
    for kind in zulmetadata.recorded_kinds():
        fields = zulmetadata.dtype_of(kind)
        expected.append((kind, ", ".join(f"`{name}` {'object' if fields[name] == object else fields[name].name}"
                                         for name in fields.names[1:])))
    assert rows == expected


def test_documented_use_is_typed(tmp_path):
    consumer = tmp_path / "consumer.py"
    consumer.write_text(CONSUMER)
    package = pathlib.Path(zulmetadata.__file__).parent.parent
    run("mypy", "--strict", str(consumer), MYPY_CACHE_DIR=str(tmp_path), MYPYPATH=str(package))
    wrong = """
zulmetadata.write_stream("a.dat", "slideTitles", "a")
zulmetadata.attach("m.mp4", 5)
zulmetadata.StreamWriter("a.dat", "slideTitle")
zulmetadata.Recording("c.mp4")["cursorLocations"]
"""
    consumer.write_text(CONSUMER + wrong)
    refused = subprocess.run([sys.executable, "-m", "mypy", "--strict", str(consumer)], capture_output=True, text=True,
                             env=os.environ | {"MYPY_CACHE_DIR": str(tmp_path), "MYPYPATH": str(package)})
    assert refused.stdout.count("[arg-type]") == 3 and refused.stdout.count("[index]") == 1, refused.stdout
    assert "Found 4 errors" in refused.stdout


def heat_map(*arguments):
    return subprocess.run([sys.executable, PROJECT / "Examples" / "heat_map.py", *arguments], capture_output=True,
                          text=True)


def test_heat_map_says_what_it_lacks(tmp_path):
    refused = heat_map()
    assert refused.returncode == 2 and refused.stderr.startswith("usage: heat_map.py [-h] RECORDING PICTURE\n")
    refused = heat_map(tmp_path / "missing.mp4", tmp_path / "heat.png")
    assert refused.returncode == 1 and refused.stderr.startswith("[Errno 2] No such file or directory")
    movie = tmp_path / "Recording.mp4"
    for lacking in ("cursorLocation", "cursorAction", "recordingRegion"):
        movie.write_bytes(PLAIN_MOVIE)
        for kind in {"cursorLocation", "cursorAction", "recordingRegion"} - {lacking}:
            zulmetadata.write_stream(tmp_path / "a.dat", kind, sample_entries(kind))
            zulmetadata.attach(movie, tmp_path / "a.dat")
        refused = heat_map(movie, tmp_path / "heat.png")
        assert (refused.returncode, refused.stderr) == (1, f"{movie}: there is no {lacking} in it\n")
    zulmetadata.write_stream(tmp_path / "a.dat", "recordingRegion", sample_entries("recordingRegion"))
    zulmetadata.write_stream(tmp_path / "b.dat", "cursorLocation", [])
    zulmetadata.attach(movie, [tmp_path / "a.dat", tmp_path / "b.dat"], replace=True)
    refused = heat_map(movie, tmp_path / "heat.png")
    assert (refused.returncode, refused.stderr) == (1, f"{movie}: there is no cursorLocation in it\n")


def test_heat_map_is_hot_where_the_cursor_was(tmp_path, plain_movie):
    # Ten seconds a quarter of the way into the region, and one second at three quarters.
    cursor = [(t / 10, 480, 270) for t in range(100)] + [(10 + t / 100, 1120, 630) for t in range(100)]
    streams = {"cursorLocation": cursor, "cursorAction": [(10.5, 1 + 16), (10.6, 2)],
               "recordingRegion": [(0, 160, 90, 1280, 720)]}
    for kind, entries in streams.items():
        zulmetadata.write_stream(tmp_path / f"{kind}.dat", kind, entries)
    zulmetadata.attach(plain_movie, [tmp_path / f"{kind}.dat" for kind in streams])

    picture = tmp_path / "heat.png"
    drawn = heat_map(plain_movie, picture)
    assert (drawn.stdout, drawn.stderr) == ("11.0 s over the region, 1 clicks\n", "")
    pixels = image.imread(picture)[:, :, :3]
    assert pixels.shape == (540, 960, 3)
    dark = pixels[:, :860].sum(axis=2) < 0.3  # the scale stands to the right
    rows = np.flatnonzero(dark.mean(axis=1) > 0.5)
    columns = np.flatnonzero(dark.mean(axis=0) > 0.5)
    region = pixels[rows[0]:rows[-1], columns[0]:columns[-1]]
    hot = np.argwhere((region[:, :, 0] > 0.6) & (region[:, :, 2] < 0.6))
    assert len(hot) > 100
    np.testing.assert_allclose(hot.mean(axis=0) / region.shape[:2], (0.25, 0.25), atol=0.03)
    assert (region[region.shape[0] // 2] < 0.1).all() and (region > 0.9).all(axis=2).any()  # nothing between; a click
