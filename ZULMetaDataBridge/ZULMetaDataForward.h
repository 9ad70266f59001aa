#pragma once

// Declares the classes and structs of this library for an application's own headers, which often need no more than a
// reference or a pointer. It costs next to nothing to include; the header of a class costs half a second, because the
// standard headers that it needs are long.

namespace ZULMetaData {

class BitmapImageRep;
class CreatorAttributes;
class CursorImage;
struct EncodedImageInfo;
class EntryDictionary;
class Image;
struct KeyStroke;
struct MediaTime;
struct Point;
struct ProcessInfo;
struct Rect;
struct ScreenPoint;
struct ScreenRect;
struct ZCAPHeader;
struct uuid;

struct ContainerItem;
class CursorImageReader;
class CursorImageSchema;
class CursorImageWriter;
struct FieldInfo;
class InvalidEntry;
struct MP4MetaData;
struct MetaDataHeader;
struct MetaDataKind;
class MetaDataParser;
struct MetaDataUUID;
struct RecognizedContainer;
struct Record;
struct RepairChange;
struct RepairPlan;
struct SchemaFieldStep;
class StreamEntries;
struct StreamEntry;
struct StreamExtent;
struct Util;

class BaseMetaDataWriter;
class CPUUsageMetaDataWriter;
class CursorActionMetaDataWriter;
class CursorImageMetaDataWriter;
class CursorLocationMetaDataWriter;
class CursorOpacityMetaDataWriter;
class HoverRectMetaDataWriter;
class KeyboardActionMetaDataWriter;
class RecordingRegionMetaDataWriter;
class ScaleFactorMetaDataWriter;
class ScrollActionMetaDataWriter;
class SlideInfoCommentMetaDataWriter;
class SlideInfoTextMetaDataWriter;
class SlideInfoTitleMetaDataWriter;
class SystemDataMetaDataWriter;
class TopmostAppNameMetaDataWriter;
class TopmostWindowMetaDataWriter;
class TopmostWindowTitleMetaDataWriter;

class BaseMetaDataParser;
class CPUUsageMetaDataParser;
class CursorActionMetaDataParser;
class CursorImageMetaDataParser;
class CursorLocationMetaDataParser;
class CursorOpacityMetaDataParser;
class HoverRectMetaDataParser;
class KeyboardActionMetaDataParser;
class RecordingRegionMetaDataParser;
class ScaleFactorMetaDataParser;
class ScrollActionMetaDataParser;
class SlideInfoCommentMetaDataParser;
class SlideInfoTextMetaDataParser;
class SlideInfoTitleMetaDataParser;
class SystemDataMetaDataParser;
class TopmostAppNameMetaDataParser;
class TopmostWindowMetaDataParser;
class TopmostWindowTitleMetaDataParser;

struct AttachResult;
struct AttachedStream;
class FileError;
struct Finding;
struct FindingRule;
struct HumanReadableActions;
struct KeyName;
class RecordingFile;
struct RedactedEntry;
struct RedactedStream;
struct RedactedTexts;
struct Redaction;
struct RetimedStream;
struct Retiming;
class SafeMovieSave;
struct SalvageReport;
struct SalvagedStream;
class SaveError;
struct StampResult;
struct StreamInfo;
struct StreamReport;
class StreamSalvage;
class StreamSource;
struct TimeRange;
struct TimeSpan;
struct ValidationReport;
class ZULMAtomRepair;
class ZULMAtomWriter;
class ZULRAtomWriter;

} // namespace ZULMetaData
