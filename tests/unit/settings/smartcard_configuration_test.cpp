#include "settings/smartcard_configuration.h"

#include <sys/stat.h>

#include <ctime>
#include <fstream>
#include <sstream>

#include "settings_fixture.h"

namespace vlm {
namespace {

namespace fs = std::filesystem;

class SmartcardConfiguration : public SettingsTest {
protected:
    using Dictionary = PropertyList::Dictionary;

    void SetUp() override {
        std::string pattern = fs::temp_directory_path() / "vlm-configuration-XXXXXX";
        ASSERT_NE(::mkdtemp(pattern.data()), nullptr);
        folder = pattern;
        file = folder / "SmartcardLogin.plist";
    }
    void TearDown() override { fs::remove_all(folder); }

    std::string binary(const PropertyList& list) {
        const auto bytes = *platform::writeBinaryPropertyList(list);
        return {bytes.begin(), bytes.end()};
    }
    void write(const std::string& content) { std::ofstream(file, std::ios::binary) << content; }

    const PropertyList mapping = Dictionary{{"AttributeMapping", Dictionary{{"fields", 1}}}};
    fs::path folder;
    fs::path file;
};

TEST_F(SmartcardConfiguration, IsWhatTheFileHolds) {
    write(binary(mapping));

    EXPECT_EQ(copySmartCardConfiguration(file), *mapping.dictionary());
    EXPECT_EQ(logged(), Lines{});
}

TEST_F(SmartcardConfiguration, LiesInTheMachinesFolderOfSettings) {
    EXPECT_STREQ(kSmartcardConfiguration, "/etc/SmartcardLogin.plist");
}

TEST_F(SmartcardConfiguration, MayBeALink) {
    write(binary(mapping));
    fs::create_symlink(file, folder / "link");

    EXPECT_TRUE(copySmartCardConfiguration(folder / "link"));
}

struct Unopened {
    const char* name;
    const char* line;
    const char* why;
};

TEST_F(SmartcardConfiguration, IsNoneAndADebugLineWhenItCannotBeOpened) {
    fs::create_directory(folder / "folder");
    ASSERT_EQ(::mkfifo((folder / "pipe").c_str(), 0600), 0);
    fs::create_symlink("loop", folder / "loop");
    fs::create_symlink("/dev/zero", folder / "device");
    const Unopened rows[] = {
        {"missing", "Failed to open configuration file (error 2)", "no file"},
        {"loop", "Failed to open configuration file (error 40)", "a link to itself"},
        {"folder", "Failed to open configuration file (error 22)", "a folder"},
        {"pipe", "Failed to open configuration file (error 22)", "a pipe without a writer"},
        {"device", "Failed to open configuration file (error 22)", "a device without an end"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.why);
        EXPECT_FALSE(copySmartCardConfiguration(folder / row.name));
        EXPECT_EQ(logged().back(), std::string("debug: ") + row.line);
    }
    EXPECT_EQ(logged().size(), std::size(rows));
}

TEST_F(SmartcardConfiguration, IsNoneAndNothingIsSaidWhenItsContentIsNoDictionary) {
    const std::string whole = binary(mapping);
    const std::pair<std::string, const char*> rows[] = {
        {"", "nothing"},
        {"\xFF\xFE garbage", "garbage"},
        {whole.substr(0, whole.size() - 1), "cut"},
        {whole + '\0', "a byte too many"},
        {binary(PropertyList::Array{"AttributeMapping"}), "an array"},
        {binary("AttributeMapping"), "a text"},
        {binary(1), "a number"},
    };
    for (const auto& [content, why] : rows) {
        write(content);

        EXPECT_FALSE(copySmartCardConfiguration(file)) << why;
    }
    EXPECT_EQ(logged(), Lines{});
}

TEST_F(SmartcardConfiguration, OfTheLargestSizeIsStillRead) {
    const std::size_t framing =
        binary(Dictionary{{"Filler", platform::Bytes(1U << 20U)}}).size() - (std::size_t{1} << 20U);
    const Dictionary large{{"Filler", platform::Bytes(kLargestConfiguration - framing)}};

    write(binary(large));
    ASSERT_EQ(fs::file_size(file), kLargestConfiguration);
    EXPECT_EQ(copySmartCardConfiguration(file), large);

    fs::resize_file(file, kLargestConfiguration + 1);
    EXPECT_FALSE(copySmartCardConfiguration(file));
    EXPECT_EQ(logged(), Lines{"error: Failed to create data for plist"});
}

TEST_F(SmartcardConfiguration, OfTwoGibibytesCostsNoTime) {
    write("bplist00");
    fs::resize_file(file, std::uintmax_t{2} << 30U);
    const auto start = std::clock();

    EXPECT_FALSE(copySmartCardConfiguration(file));

    EXPECT_LT(std::clock() - start, CLOCKS_PER_SEC / 10) << "time of the processor";
    EXPECT_EQ(logged(), Lines{"error: Failed to create data for plist"});
}

// A file whose size does not tell what can be read from it, as one that is cut off while it is
// read.
class Shrinking : public std::stringbuf {
public:
    Shrinking(const std::string& content, std::streamoff size)
        : std::stringbuf(content, std::ios::in), _size(size) {}

private:
    pos_type seekoff(off_type offset, std::ios::seekdir from, std::ios::openmode which) override {
        if (from == std::ios::end) return _size;
        if (from == std::ios::cur) return std::exchange(_size, -1);
        return std::stringbuf::seekoff(offset, from, which);
    }

    std::streamoff _size;
};

TEST_F(SmartcardConfiguration, ThatCameShortIsTakenForFilledUpWithZeros) {
    Dictionary list{{"AttributeMapping", true}, {"Filler", ""}};
    std::string whole = binary(list);
    for (std::string filler; whole.back() != '\0'; whole = binary(list))
        list.set("Filler", filler += 'x');
    Shrinking cut(whole.substr(0, whole.size() - 1), static_cast<std::streamoff>(whole.size()));
    std::istream stream(&cut);

    EXPECT_EQ(readSmartCardConfiguration(stream), list);
}

TEST_F(SmartcardConfiguration, ThatCameShortOfMoreThanZerosIsNoneAndNothingIsSaid) {
    const std::string whole = binary(mapping);
    Shrinking cut(whole.substr(0, whole.size() / 2), static_cast<std::streamoff>(whole.size()));
    std::istream stream(&cut);

    EXPECT_FALSE(readSmartCardConfiguration(stream));
    EXPECT_EQ(logged(), Lines{});
}

TEST_F(SmartcardConfiguration, HasNoRoomForASizeThatCannotBe) {
    for (const std::streamoff size : {std::streamoff{-1}, std::streamoff{1} << 62U}) {
        Shrinking buffer("", size);
        std::istream stream(&buffer);

        EXPECT_FALSE(readSmartCardConfiguration(stream)) << size;
        EXPECT_EQ(logged().back(), "error: Failed to create data for plist");
    }
}

}  // namespace
}  // namespace vlm
