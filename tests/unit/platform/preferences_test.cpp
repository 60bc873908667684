#include "platform/preferences.h"

#include <gtest/gtest.h>

#include <string>

namespace vlm::platform {

namespace {

TEST(PreferencesDomainTest, IsANameThatIsSafeInAFileName) {
    const struct {
        std::string text;
        bool isDomain;
        const char* why;
    } rows[] = {
        {"org.vlm.smartcard", true, "a reverse-DNS name"},
        {"com.example-2.my_app", true, "hyphens, digits and underscores occur"},
        {"single", true, "one part is a name too"},
        {std::string(200, 'a'), true, "the longest one"},
        {std::string(201, 'a'), false, "too long for a file name with what is put around it"},
        {"", false, "no name"},
        {".", false, "the folder itself"},
        {"..", false, "the folder above"},
        {"../org.example", false, "leaves the folder"},
        {"org/example", false, "names a folder"},
        {"/etc/passwd", false, "an absolute path"},
        {".org.example", false, "a hidden file; those are the store's own"},
        {"org.example.", false, "an empty part at the end"},
        {"org..example", false, "an empty part inside"},
        {"org.ex ample", false, "a space"},
        {"org.ex\nample", false, "a line feed would forge log lines"},
        {std::string("org\0example", 11), false, "the file system would see the part before"},
        {"org.ex\xC3\xA4mple", false, "DNS names are ASCII"},
    };

    for (const auto& row : rows) EXPECT_EQ(isPreferencesDomain(row.text), row.isDomain) << row.why;
}

}  // namespace

}  // namespace vlm::platform
