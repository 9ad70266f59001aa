#include "Tests/Support/Bytes.h"
#include "Tests/Support/Files.h"
#include "Tests/ZULMetaDataBridge/EntriesAsText.h"
#include "Tests/ZULMetaDataBridge/KindSamples.h"
#include "Tests/ZULMetaDataBridge/StreamFixture.h"
#include "ZULMetaDataBridge/ZULMetaDataBridge.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <limits>
#include <list>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace ZULMetaData::Test {

namespace {

using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;

// ---- The texts ------------------------------------------------------------------------------------------------

ProcessInfo machineWithEightProcessors() {
    ProcessInfo machine;
    machine.processorCount = 8;
    machine.activeProcessorCount = 6;
    machine.physicalMemory = 17179869184;
    machine.operatingSystemVersionString = "Version 14.2";
    machine.operatingSystemVersion = {1, 2, 3};
    return machine;
}

std::string memoryText(std::uint64_t bytes) {
    ProcessInfo machine = machineWithEightProcessors();
    machine.physicalMemory = bytes;
    return SystemDataMetaDataWriter::systemTexts(machine).back();
}

TEST(SystemTexts, NameProcessorsActiveOnesSystemAndMemoryInThisOrder) {
    EXPECT_THAT(SystemDataMetaDataWriter::systemTexts(machineWithEightProcessors()),
                ElementsAre("ProcessorCount:8", "ActiveProcessorCount:6", "OSVersion:Version 14.2", "RAM:16384MB"));
}

TEST(SystemTexts, GiveMemoryInWholeMebibytes) {
    EXPECT_EQ(memoryText(17179869184), "RAM:16384MB");
    EXPECT_EQ(memoryText(17179869183), "RAM:16383MB");
    EXPECT_EQ(memoryText(1048576), "RAM:1MB");
    EXPECT_EQ(memoryText(1048575), "RAM:0MB");
    EXPECT_EQ(memoryText(0), "RAM:0MB");
    EXPECT_EQ(memoryText(18446744073709551615U), "RAM:17592186044415MB");
}

TEST(SystemTexts, HaveRoomForTheLargestCounts) {
    ProcessInfo machine;
    machine.processorCount = machine.activeProcessorCount = std::numeric_limits<std::uint64_t>::max();
    const std::list<std::string> texts = SystemDataMetaDataWriter::systemTexts(machine);
    EXPECT_EQ(texts.front(), "ProcessorCount:18446744073709551615");
    EXPECT_EQ(*std::next(texts.begin()), "ActiveProcessorCount:18446744073709551615");
}

TEST(SystemTexts, TakeTheVersionOfTheSystemAsItIs) {
    for (const std::string version : {"", "%s %d: x", "14.2:1", "\xc3\xa9\xff"}) {
        ProcessInfo machine;
        machine.operatingSystemVersionString = version;
        EXPECT_EQ(*std::next(SystemDataMetaDataWriter::systemTexts(machine).begin(), 2), "OSVersion:" + version);
    }
}

TEST(SystemTexts, AreStoredAsOneList) {
    std::ostringstream stream;
    metaDataWrite(0.0, SystemDataMetaDataWriter::systemTexts(machineWithEightProcessors()), stream, 1);
    EXPECT_EQ(stream.str(), SystemDataSamples::samples().at(0).bytes);
}

// ---- Writing --------------------------------------------------------------------------------------------------

class SystemData : public StreamFixture {
protected:
    const std::string header = streamHeader("2b7b6afc", 1, 0);

    static std::string textRecord(const std::string& text, double time = 0) {
        return le32(static_cast<std::uint32_t>(text.size() + 8)) + f64(time) + text;
    }

    static std::string listOf(const std::vector<std::string>& texts, double time = 0) {
        std::string records;
        for (const std::string& text : texts)
            records += textRecord(text, time);
        return le32(static_cast<std::uint32_t>(4 + records.size())) + le32(static_cast<std::uint32_t>(texts.size())) +
               records;
    }

    std::vector<std::string> readLists(const std::string& lists) const {
        return read<SystemDataMetaDataParser>(header + lists);
    }

    std::string osVersionReadFrom(const std::string& stored) const {
        writeFile(file, header + listOf({"a", "b", stored, "d"}));
        return SystemDataMetaDataParser(file).read()->at(0).get<std::string>("osVersion");
    }
};

TEST_F(SystemData, DescribesThisMachine) {
    SystemDataMetaDataWriter(file).write();
    const ProcessInfo machine = ProcessInfo::current();
    EXPECT_EQ(contentsOf(file),
              header + listOf({"ProcessorCount:" + std::to_string(machine.processorCount),
                               "ActiveProcessorCount:" + std::to_string(machine.activeProcessorCount),
                               "OSVersion:" + machine.operatingSystemVersionString,
                               "RAM:" + std::to_string(machine.physicalMemory / 1024 / 1024) + "MB"}));
}

TEST_F(SystemData, IsWrittenOnceAndItsFileClosedAtOnce) {
    SystemDataMetaDataWriter writer(file);
    EXPECT_FALSE(writer.hasWritten());
    writer.write();
    EXPECT_TRUE(writer.hasWritten());
    EXPECT_FALSE(writer.metaDataWriter()->getStream().is_open());
    const std::string once = contentsOf(file);
    writer.write();
    EXPECT_EQ(contentsOf(file), once);
    EXPECT_TRUE(writer.metaDataWriter()->getStream().good());
}

TEST_F(SystemData, IsNotWrittenOnceTheApplicationSaysThatItWas) {
    SystemDataMetaDataWriter writer(file);
    writer.setHasWritten(true);
    writer.write();
    EXPECT_EQ(contentsOf(file), header);
    EXPECT_TRUE(writer.metaDataWriter()->getStream().is_open());
}

TEST_F(SystemData, IsReadBackFromThisMachine) {
    SystemDataMetaDataWriter(file).write();
    const auto entries = SystemDataMetaDataParser(file).read();
    ASSERT_EQ(entries->size(), 1U);
    const ProcessInfo machine = ProcessInfo::current();
    EXPECT_EQ(entries->at(0).get<std::string>("processorCount"),
              "ProcessorCount:" + std::to_string(machine.processorCount));
    EXPECT_EQ(entries->at(0).get<float>("timestamp"), 0.0F);
}

// ---- Reading --------------------------------------------------------------------------------------------------

TEST_F(SystemData, IsReadAsWholeTextsWithTheirPrefixes) {
    EXPECT_THAT(
        readLists(listOf({"ProcessorCount:8", "ActiveProcessorCount:8", "OSVersion:Version 14.2", "RAM:16384MB"})),
        ElementsAre("processorCount = text 'ProcessorCount:8', activeProcessorCount = text 'ActiveProcessorCount:8', "
                    "osVersion = text 'OSVersion:Version 14.2', ram = text 'RAM:16384MB', timestamp = float 0"));
}

TEST_F(SystemData, IsReadByTheirPositionWhateverTheTextsSay) {
    EXPECT_THAT(readLists(listOf({"d", "c", "b", "a"})),
                ElementsAre("processorCount = text 'd', activeProcessorCount = text 'c', osVersion = text 'b', "
                            "ram = text 'a', timestamp = float 0"));
}

TEST_F(SystemData, IsReadAtTimeZeroWhateverTimeItsTextsHave) {
    EXPECT_THAT(readLists(listOf({"a", "b", "c", "d"}, 5.0)), ElementsAre(EndsWith("timestamp = float 0")));
}

TEST_F(SystemData, MayHoldMoreThanFourTexts) {
    EXPECT_THAT(readLists(listOf({"a", "b", "c", "d", "\xff"}) + listOf({"e", "f", "g", "h", "i", "j"})),
                ElementsAre("processorCount = text 'a', activeProcessorCount = text 'b', osVersion = text 'c', "
                            "ram = text 'd', timestamp = float 0",
                            "processorCount = text 'e', activeProcessorCount = text 'f', osVersion = text 'g', "
                            "ram = text 'h', timestamp = float 0"));
}

TEST_F(SystemData, IsRefusedWithFewerThanFourTextsAndTheEntriesInFrontAreKept) {
    for (const auto& texts : {std::vector<std::string>(), {"a"}, {"a", "b", "c"}}) {
        writeFile(file, header + listOf({"a", "b", "c", "d"}) + listOf(texts) + listOf({"e", "f", "g", "h"}));
        SystemDataMetaDataParser parser(file);
        EXPECT_THROW(parser.read(), std::out_of_range) << texts.size();
        EXPECT_THAT(asTexts(*parser.systemDataMetaData()),
                    ElementsAre("processorCount = text 'a', activeProcessorCount = text 'b', osVersion = text 'c', "
                                "ram = text 'd', timestamp = float 0"));
    }
}

TEST_F(SystemData, IsDecodedByteByByte) {
    EXPECT_EQ(osVersionReadFrom("caf\xe9"), "caf\xc3\xa9");
    EXPECT_EQ(osVersionReadFrom("\x80\xff"), "\xc2\x80\xc3\xbf");
    EXPECT_EQ(osVersionReadFrom("caf\xc3\xa9"), "caf\xc3\x83\xc2\xa9");
}

TEST_F(SystemData, EndsATextAtItsFirstZeroByte) {
    EXPECT_EQ(osVersionReadFrom(std::string("ab\0cd", 5)), "ab");
}

TEST_F(SystemData, MayHoldEmptyTexts) {
    EXPECT_THAT(readLists(listOf({"", "", "", ""})),
                ElementsAre("processorCount = text '', activeProcessorCount = text '', osVersion = text '', "
                            "ram = text '', timestamp = float 0"));
}

TEST_F(SystemData, RepeatsTheLastCharacterOfItsLastTextWhereItIsCut) {
    const std::string entry = listOf({"a", "b", "c", "RAM:1MB"});
    EXPECT_THAT(readLists(entry.substr(0, entry.size() - 3)),
                ElementsAre("processorCount = text 'a', activeProcessorCount = text 'b', osVersion = text 'c', "
                            "ram = text 'RAM::::', timestamp = float 0"));
}

TEST_F(SystemData, IsDroppedWhereOneOfItsTextsIsMissing) {
    const std::string whole = listOf({"a", "b", "c", "d"});
    const std::string cut = listOf({"e", "f", "g", "h"});
    for (const std::size_t size : {std::size_t{1}, std::size_t{5}, std::size_t{8}, std::size_t{20}, cut.size() - 13})
        EXPECT_THAT(readLists(whole + cut.substr(0, size)),
                    ElementsAre("processorCount = text 'a', activeProcessorCount = text 'b', osVersion = text 'c', "
                                "ram = text 'd', timestamp = float 0"))
            << size;
}

/// Without its number of texts a list counts as empty.
TEST_F(SystemData, IsRefusedWhereItsNumberOfTextsIsMissing) {
    writeFile(file, header + listOf({"a", "b", "c", "d"}) + le32(56));
    SystemDataMetaDataParser parser(file);
    EXPECT_THROW(parser.read(), std::out_of_range);
    EXPECT_EQ(parser.systemDataMetaData()->size(), 1U);
}

TEST_F(SystemData, DoesNotDependOnTheTotalOfItsList) {
    std::string list = listOf({"a", "b", "c", "d"});
    list.replace(0, 4, hex("ffffffff"));
    EXPECT_EQ(readLists(list + listOf({"e", "f", "g", "h"})).size(), 2U);
}

} // namespace

} // namespace ZULMetaData::Test
