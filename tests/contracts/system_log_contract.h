// What platform/system_log.h promises. Verbs: delivered(), the lines that arrived so far.

#pragma once

#include <string>
#include <vector>

#include "platform/system_log.h"
#include "tests/contracts/contract_test.h"

namespace vlm::contracts {

struct LogLine {
    std::string subsystem;
    std::string category;
    platform::LogLevel level = platform::LogLevel::Default;
    std::string text;
    std::string activity = {};
    bool operator==(const LogLine&) const = default;
};

template <typename Backend>
class SystemLogContract : public ContractTest<Backend> {};

TYPED_TEST_SUITE_P(SystemLogContract);

TYPED_TEST_P(SystemLogContract, DeliversARecordWithAllThatItHolds) {
    this->backend().get().write(
        {"org.example", "pairing", platform::LogLevel::Error, "it did not work"});

    EXPECT_EQ(this->backend().delivered(),
              (std::vector<LogLine>{
                  {"org.example", "pairing", platform::LogLevel::Error, "it did not work"}}));
}

TYPED_TEST_P(SystemLogContract, DeliversTheActivityOfARecordThatHasOne) {
    this->backend().get().write({"s", "c", platform::LogLevel::Error, "x", "clicked 'Pair'"});
    this->backend().get().write({"s", "c", platform::LogLevel::Error, "x"});

    const auto lines = this->backend().delivered();

    ASSERT_EQ(lines.size(), 2U);
    EXPECT_EQ(lines[0].activity, "clicked 'Pair'");
    EXPECT_EQ(lines[1].activity, "");
}

TYPED_TEST_P(SystemLogContract, KeepsLevelsAndOrder) {
    using platform::LogLevel;
    const std::vector<LogLevel> levels{LogLevel::Info, LogLevel::Error, LogLevel::Default};

    for (const auto level : levels) this->backend().get().write({"s", "c", level, "x"});

    std::vector<LogLevel> arrived;
    for (const auto& line : this->backend().delivered()) arrived.push_back(line.level);
    EXPECT_EQ(arrived, levels);
}

TYPED_TEST_P(SystemLogContract, KeepsARecordWithLineFeedsInOnePiece) {
    this->backend().get().write({"s", "c", platform::LogLevel::Error, "one\ntwo\nMESSAGE=three"});

    const auto lines = this->backend().delivered();

    ASSERT_EQ(lines.size(), 1U);
    EXPECT_EQ(lines[0].text, "one\ntwo\nMESSAGE=three");
}

TYPED_TEST_P(SystemLogContract, TakesUtf8AndEmptyText) {
    this->backend().get().write({"s", "c", platform::LogLevel::Error, "gr\xC3\xBC\xC3\x9F"});
    this->backend().get().write({"s", "c", platform::LogLevel::Error, ""});

    const auto lines = this->backend().delivered();

    ASSERT_EQ(lines.size(), 2U);
    EXPECT_EQ(lines[0].text, "gr\xC3\xBC\xC3\x9F");
    EXPECT_EQ(lines[1].text, "");
}

TYPED_TEST_P(SystemLogContract, DeliversEveryLevelThatItSaysItCollects) {
    using platform::LogLevel;
    std::size_t collected = 0;
    for (const auto level : {LogLevel::Error, LogLevel::Default, LogLevel::Info, LogLevel::Debug}) {
        if (this->backend().get().collects(level)) ++collected;
        this->backend().get().write({"s", "c", level, "x"});
    }

    EXPECT_GE(collected, 1U);
    EXPECT_EQ(this->backend().delivered().size(), collected);
}

REGISTER_TYPED_TEST_SUITE_P(SystemLogContract, DeliversARecordWithAllThatItHolds,
                            DeliversTheActivityOfARecordThatHasOne, KeepsLevelsAndOrder,
                            KeepsARecordWithLineFeedsInOnePiece, TakesUtf8AndEmptyText,
                            DeliversEveryLevelThatItSaysItCollects);

}  // namespace vlm::contracts
