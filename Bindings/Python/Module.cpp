// zulmetadata._core, the module below the package in zulmetadata/. Its types are described in _core.pyi.

#include "Bindings/Python/EntryArrays.h"
#include "Bindings/Python/PythonTexts.h"
#include "Bindings/Python/SessionArrays.h"
#include "Bindings/Python/StreamWriter.h"
#include "ZULMetaDataBridge/Source/HumanReadableActions.h"
#include "ZULMetaDataBridge/Source/KeyNames.h"
#include "ZULMetaDataBridge/Source/RecordingFile.h"
#include "ZULMetaDataBridge/Source/ReportedNames.h"
#include "ZULMetaDataBridge/Source/SafeMovieSave.h"
#include "ZULMetaDataSession/Error.h"

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>
#include <pybind11/stl.h>
#include <pybind11/stl/filesystem.h>

#include <memory>
#include <optional>
#include <utility>

namespace ZULMetaData::Python {

namespace {

/// Throws `OSError` for a file that cannot be opened or read, `ValueError` for one that can hold no metadata.
RecordingFile openRecording(const FileLocation& file) {
    try {
        const py::gil_scoped_release others;
        return RecordingFile(file);
    } catch (const FileError&) {
        throw;
    } catch (const std::runtime_error& refusal) {
        throwValueError(refusal.what());
    }
}

/// A stream of a recording, found when the recording was opened.
struct RecordedStream : StreamInfo {
    FileLocation file;
    MetaDataHeader header;

    /// Opens the file when it is used.
    StreamSource source() const { return StreamSource::part(file, offset, declaredBytes); }
};

/// What a recording was found to hold. It keeps no file open.
struct RecordingSummary {
    std::string container;
    std::optional<double> duration;
    std::vector<CreatorAttributes> creators;
    std::vector<RecordedStream> streams;
};

RecordingSummary lookInto(const FileLocation& file) {
    const RecordingFile recording = openRecording(file);
    const py::gil_scoped_release others;
    RecordingSummary found{containerName(recording.container()), recording.duration(), {}, {}};
    for (const ZCAPHeader& info : recording.creators())
        found.creators.push_back(info.creator);
    for (const StreamInfo& stream : recording.streams())
        found.streams.push_back({stream, file, recording.entriesOf(stream).header().value_or(MetaDataHeader())});
    return found;
}

/// Looks for one stream and for nothing else, because a scan of many recordings opens each of them for it.
py::object readKind(const FileLocation& file, const std::string& kind) {
    const uuid type = kindNamed(kind).type;
    RecordingFile recording = openRecording(file);
    const auto [offset, length] = recording.parser().fileDataForUUID(type);
    if (offset == 0 && length == 0)
        return py::none();
    return readEntriesOf(type, recording.bytes().part(offset, length), recording.name());
}

py::bytes bytesOf(const RecordedStream& stream) {
    std::string bytes;
    {
        const py::gil_scoped_release others;
        orFileError(utf8Path(stream.file), [&] {
            const ByteSource opened = stream.source().open();
            bytes.resize(static_cast<std::size_t>(opened.size()));
            bytes.resize(opened.read(0, bytes));
        });
    }
    return {bytes};
}

/// Stream files, and streams of other recordings.
std::vector<StreamSource> sourcesOf(const py::iterable& streams, bool unchecked) {
    std::vector<StreamSource> sources;
    for (const py::handle stream : streams) {
        const StreamSource source = py::isinstance<RecordedStream>(stream)
                                        ? stream.cast<RecordedStream>().source()
                                        : StreamSource::file(stream.cast<FileLocation>());
        sources.push_back(unchecked ? source.unchecked() : source);
    }
    return sources;
}

AttachResult attach(const FileLocation& movie, const py::iterable& streams, bool replace, bool unchecked) {
    const std::vector<StreamSource> sources = sourcesOf(streams, unchecked);
    const py::gil_scoped_release others;
    return SafeMovieSave(movie).attach(sources, replace ? ExistingStreams::Supersede : ExistingStreams::Refuse);
}

CreatorAttributes stamp(const FileLocation& movie, const py::object& creator, const py::object& version) {
    const std::string creatorName = storedText(creator);
    const std::string creatorVersion = storedText(version);
    const py::gil_scoped_release others;
    return SafeMovieSave(movie).stamp(creatorName, creatorVersion).info.creator;
}

RepairPlan repair(const FileLocation& movie, bool dryRun) {
    return dryRun ? SafeMovieSave(movie).plan() : SafeMovieSave(movie).repair();
}

ValidationReport verify(const FileLocation& file) {
    RecordingFile recording = openRecording(file);
    const py::gil_scoped_release others;
    return recording.validation();
}

const char* stateOf(const RepairPlan& plan) {
    return repairStateName(plan.state);
}

const char* reasonOf(const SaveError& error) {
    switch (error.reason()) {
    case SaveError::Reason::Failed: return "failed";
    case SaveError::Reason::KindExists: return "kind-exists";
    case SaveError::Reason::Doubtful: return "doubtful";
    case SaveError::Reason::NotUndone: break;
    }
    return "not-undone";
}

void setSaveError(const py::handle& type, const SaveError& error) {
    const py::object exception = type(pathText(error.what()));
    exception.attr("file") = pathText(error.file());
    exception.attr("sentence") = pathText(error.sentence());
    exception.attr("reason") = reasonOf(error);
    PyErr_SetObject(type.ptr(), exception.ptr());
}

void setOSError(const py::tuple& arguments) {
    PyErr_SetObject(PyExc_OSError, arguments.ptr());
}

/// Returns a method that formats its object. The properties of the object are those of argument 0 of the format.
auto formatted(const char* format) {
    return [format](const py::object& self) { return py::str(format).format(self); };
}

void addErrors(py::module_& module) {
    using namespace py::literals;
    const py::dict unknown("file"_a = "", "sentence"_a = "", "reason"_a = "failed"); // of those that Python code makes
    static const py::handle saveError = PyErr_NewExceptionWithDoc(
        "zulmetadata.SaveError",
        "A movie was not changed as it should. `file` is the movie or the source, and `sentence` says why. If "
        "`reason`\n"
        "is 'failed' or 'kind-exists', the movie is unchanged; the latter means that it already has a stream of that\n"
        "kind. If `reason` is 'not-undone', the movie could not be restored.",
        PyExc_RuntimeError, unknown.ptr());
    module.attr("SaveError") = saveError;
    py::register_exception_translator([](std::exception_ptr thrown) {
        try {
            std::rethrow_exception(std::move(thrown));
        } catch (const SaveError& error) {
            setSaveError(saveError, error);
        } catch (const FileError& error) {
            setOSError(py::make_tuple(error.code().value(), error.code().message(), pathText(error.file())));
        } catch (const std::system_error& error) {
            setOSError(py::make_tuple(error.code().value(), pathText(error.what())));
        } catch (const Error& error) {
            PyErr_SetObject(PyExc_ValueError, pathText(error.what()).ptr());
        }
    });
}

template <std::string (CreatorAttributes::*text)() const>
py::str creatorText(const CreatorAttributes& creator) {
    return pythonText((creator.*text)());
}

void addReading(py::module_& module) {
    py::class_<RecordedStream>(module, "RecordedStream",
                               "A stream of a recording: its place in the file, its kind and its version.")
        .def_property_readonly("kind", &RecordedStream::name, "The name of the kind, or its UUID if it has no name.")
        .def_property_readonly(
            "uuid", [](const RecordedStream& stream) { return uuidText(stream.type); },
            "The identifier of the kind, as text.")
        .def_property_readonly(
            "version", [](const RecordedStream& stream) { return stream.header.version; },
            "The version of the entries.")
        .def_readonly("offset", &RecordedStream::offset, "The position of the header in the file.")
        .def_readonly("bytes", &RecordedStream::declaredBytes, "The size that the container declares, header included.")
        .def_property_readonly(
            "is_decodable", [](const RecordedStream& stream) { return isDecodable(stream.header); },
            "True if `read` knows the kind and the version.")
        .def(
            "read",
            [](const RecordedStream& stream) {
                return orFileError(utf8Path(stream.file), [&] { return readEntries(stream.source()); });
            },
            "Returns the whole entries, as a NumPy array of records.")
        .def("raw", bytesOf, "Returns the bytes of the stream, header included.")
        .def("__repr__", formatted("<RecordedStream {0.kind} version={0.version} offset={0.offset} bytes={0.bytes}>"));
    py::class_<RecordingSummary>(module, "RecordingFile")
        .def(py::init(&lookInto), py::arg("path"))
        .def_property_readonly("container",
                               [](const RecordingSummary& file) { return py::str(file.container).attr("lower")(); })
        .def_readonly("duration", &RecordingSummary::duration)
        .def_readonly("creators", &RecordingSummary::creators)
        .def_readonly("streams", &RecordingSummary::streams);
    py::class_<CreatorAttributes>(module, "Creator", "A stamp of a movie: the name of the platform and two versions.")
        .def_property_readonly("name", creatorText<&CreatorAttributes::name>,
                               "The name of the platform: 'Mac', whatever the system was.")
        .def_property_readonly("version", creatorText<&CreatorAttributes::version>,
                               "The version of the application that made the recording.")
        .def_property_readonly("platform_version", creatorText<&CreatorAttributes::platformVersion>,
                               "The version of the operating system.")
        .def("__repr__",
             formatted("<Creator {0.name!r} version={0.version!r} platform_version={0.platform_version!r}>"));
}

/// A key without a name is the character of its low 8 bits.
std::string keyText(std::uint32_t code, std::uint32_t flags) {
    return keyNameOf({code, flags}).text;
}

void addKinds(py::module_& module) {
    module.def("read_kind", readKind, py::arg("path"), py::arg("kind"),
               "Returns the entries of one kind in a recording, or None if it has none.");
    module.def("dtype_of", typeOfEntries, py::arg("kind"),
               "Returns the fields of an entry of this kind. Raises `KeyError` for a kind without entries.");
    module.def("coordinates_of", coordinatesOf, py::arg("kind"));
    module.def(
        "recorded_kinds",
        [] {
            std::vector<std::string> names;
            RecordedKinds::forEach([&names]<class Kind>() { names.push_back(metaDataKindName(Kind::type)); });
            return names;
        },
        "Returns the names of all kinds that have entries.");
    module.def("action_text", &HumanReadableActions::CursorActionToString, py::arg("action"),
               "Returns a text such as \"left down + shift\" for a \"rawActionValue\" of cursorAction.");
    module.def(
        "key_text", keyText, py::arg("code"), py::arg("flags") = 0,
        "Returns the name of a key, for \"characterCode\" and \"eventFlagsCode\" of keyboardAction. Without the flag "
        "(IsVK) the code is that of a character.");
    module.def(
        "modifiers_text",
        [](std::uint32_t flags) {
            return HumanReadableActions::KeyboardModifiersToString(static_cast<std::int32_t>(flags));
        },
        py::arg("flags"), "Returns a text such as \"<Shift><Cmd>\" for an \"eventFlagsCode\" of keyboardAction.");
}

void addWriting(py::module_& module) {
    py::class_<StreamWriter>(module, "StreamWriterFile")
        .def(py::init([](const FileLocation& file, const std::string& kind) {
                 return std::make_unique<StreamWriter>(file, kindNamed(kind));
             }),
             py::arg("path"), py::arg("kind"))
        .def("extend", &StreamWriter::extend, py::arg("entries"))
        .def("flush", &StreamWriter::flush, "Passes the entries written so far to the operating system.")
        .def("close", &StreamWriter::close, "Writes what is left and closes the file. May be called more than once.")
        .def_property_readonly("closed", &StreamWriter::isClosed, "True after `close`.")
        .def_property_readonly(
            "entries_written", &StreamWriter::entriesWritten,
            "The number of entries written since the file was created, those in the buffer included.");
    module.def(
        "write_stream",
        [](const FileLocation& file, const std::string& kind, const py::array& entries) {
            StreamWriter::writeFile(file, kindNamed(kind), entries);
        },
        py::arg("path"), py::arg("kind"), py::arg("entries"));
}

void addRepairing(py::module_& module) {
    py::class_<RepairChange>(module, "RepairChange", "Bytes of a movie that a repair replaces.")
        .def_readonly("offset", &RepairChange::offset, "The position in the movie.")
        .def_property_readonly(
            "before", [](const RepairChange& change) { return py::bytes(change.before); },
            "The bytes before the repair.")
        .def_property_readonly(
            "after", [](const RepairChange& change) { return py::bytes(change.after); },
            "The bytes after the repair; empty if the end of the file is cut off.")
        .def_readonly("reason", &RepairChange::reason, "The reason, in one sentence.")
        .def("__repr__", [](const RepairChange& change) {
            return py::str("<RepairChange offset={} bytes={}: {}>")
                .format(change.offset, change.before.size(), change.reason);
        });
    py::class_<RepairPlan>(module, "Repair", "What is wrong with the atoms of a movie, and how it is repaired.")
        .def_property_readonly("state", stateOf, "'whole', 'repairable' or 'unrepairable'.")
        .def_readonly("changes", &RepairPlan::changes,
                      "The changes, in the order in which they are made; empty if there is no repair.")
        .def_readonly("finding", &RepairPlan::finding, "What is wrong, in one sentence; empty if nothing is.")
        .def_readonly("offset", &RepairPlan::offset, "The position of the atom that is wrong.")
        .def_readonly("has_loss", &RepairPlan::hasLoss, "Part of the metadata at the end of the movie is missing.")
        .def_readonly("loss", &RepairPlan::loss, "What is missing, in words; empty if nothing is.")
        .def("__repr__", [](const RepairPlan& plan) {
            return py::str("<Repair {} changes={}>").format(stateOf(plan), plan.changes.size());
        });
    module.def("repair", repair, py::arg("movie"), py::arg("dry_run"), py::call_guard<py::gil_scoped_release>());
}

void addSaving(py::module_& module) {
    py::class_<AttachedStream>(module, "AttachedStream", "A stream that was attached.")
        .def_property_readonly(
            "name", [](const AttachedStream& stream) { return pathText(stream.name); }, "The path of the source.")
        .def_property_readonly(
            "kind", [](const AttachedStream& stream) { return metaDataKindName(stream.type); },
            "The name of the kind, or its UUID if it has no name.")
        .def_readonly("offset", &AttachedStream::offset, "The position of the header in the movie.")
        .def_readonly("bytes", &AttachedStream::bytes, "The size of the header and the whole entries.")
        .def_readonly("entries", &AttachedStream::entries, "The number of whole entries, which are now in the movie.")
        .def_readonly("bytes_cut", &AttachedStream::bytesCut,
                      "The number of bytes after the last whole entry, left out.")
        .def("__repr__",
             formatted("<AttachedStream {0.kind} offset={0.offset} entries={0.entries} bytes_cut={0.bytes_cut}>"));
    py::class_<AttachResult>(module, "Attached", "What `attach` did.")
        .def_readonly("repair", &AttachResult::repair, "The repair that was made first.")
        .def_readonly("streams", &AttachResult::streams, "The streams, in the order of the arguments.")
        .def("__repr__", [](const AttachResult& attached) {
            return py::str("<Attached streams={} repair={}>").format(attached.streams.size(), stateOf(attached.repair));
        });
    module.def("attach", attach, py::arg("movie"), py::arg("streams"), py::arg("replace"), py::arg("unchecked"));
    module.def("stamp", stamp, py::arg("movie"), py::arg("creator"), py::arg("version"));
}

void addVerifying(py::module_& module) {
    py::class_<Finding>(module, "Finding", "Something that `verify` found.")
        .def_property_readonly(
            "code", [](const Finding& finding) { return ruleOf(finding.code).name; },
            "The name of the rule, such as 'torn-entry'.")
        .def_property_readonly(
            "is_damage", [](const Finding& finding) { return finding.severity() == Severity::Damage; },
            "True if something is lost, cannot be reached, or contradicts itself.")
        .def_readonly("place", &Finding::place, "The kind of the stream, or the type of the atom.")
        .def_readonly("offset", &Finding::offset, "The position in the file.")
        .def_readonly("sentence", &Finding::sentence, "What was found, in a sentence with the numbers.")
        .def("__str__", formatted("{0.place} at offset {0.offset}: {0.sentence}"))
        .def("__repr__", formatted("<Finding {0.code} {0.place} offset={0.offset}: {0.sentence}>"));
    py::class_<StreamReport>(module, "StreamReport", "What `verify` says about one stream.")
        .def_property_readonly("kind", &StreamReport::name, "The name of the kind, or its UUID if it has no name.")
        .def_readonly("version", &StreamReport::version, "The version of the entries; -1 if the header is cut short.")
        .def_readonly("offset", &StreamReport::offset, "The position of the header in the file.")
        .def_readonly("entries", &StreamReport::wholeEntries, "The number of entries that are whole and valid.")
        .def_readonly("first_time", &StreamReport::firstTime,
                      "The time in seconds of the first entry whose time is finite, or None.")
        .def_readonly("last_time", &StreamReport::lastTime,
                      "The time in seconds of the last entry whose time is finite, or None.")
        .def_readonly("is_reachable", &StreamReport::isReachable, "True if readers find the stream.")
        .def("__repr__", formatted("<StreamReport {0.kind} offset={0.offset} entries={0.entries}>"));
    py::class_<ValidationReport>(module, "Report", "What `verify` says about a file.")
        .def_readonly("bytes", &ValidationReport::bytes, "The size of the file.")
        .def_readonly("streams", &ValidationReport::streams, "The streams, in the order of the file; at most 1000.")
        .def_property_readonly("findings", &ValidationReport::allFindings,
                               "The findings, in the order of their offsets; a very long list is cut off.")
        .def_property_readonly("is_damaged", &ValidationReport::isDamaged, "True if a finding is damage.")
        .def_property_readonly("has_metadata", &ValidationReport::hasMetaData,
                               "True if there are streams, whole or not.")
        .def("__repr__", [](const ValidationReport& report) {
            return py::str("<Report bytes={} streams={} findings={}{}>")
                .format(report.bytes, report.streamCount, report.damageCount + report.noticeCount,
                        report.isDamaged() ? ": damaged" : "");
        });
    module.def(
        "verify", verify, py::arg("path"),
        "Checks the metadata of a movie, RIFF file or stream file, and returns a report. Does not change the file.");
}

} // namespace

PYBIND11_MODULE(_core, module) {
    module.attr("__version__") = ZULMETADATA_VERSION;
    addErrors(module);
    addReading(module);
    addKinds(module);
    addWriting(module);
    addRepairing(module);
    addSaving(module);
    addVerifying(module);
    addSession(module);
}

} // namespace ZULMetaData::Python
