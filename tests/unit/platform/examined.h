// What the readers of the text formats say, and what it is held against.

#pragma once

#include <gtest/gtest.h>

#include <string_view>

#include "platform/property_list.h"

namespace vlm::test {

inline platform::PropertyListExamination examine(std::string_view text,
                                                 const platform::PropertyListLimits& limits = {}) {
    return examinePropertyList(platform::Bytes(text.begin(), text.end()), limits);
}

inline platform::PropertyListExamination examineXmlValue(std::string_view element) {
    return examine("<plist>" + std::string(element) + "</plist>");
}

inline void expectValue(const platform::PropertyListExamination& found,
                        platform::PropertyListFormat format, const platform::PropertyList& value,
                        const char* why) {
    EXPECT_EQ(found.value, value) << why << ": " << found.problem;
    EXPECT_EQ(found.format, format) << why;
    EXPECT_EQ(found.problem, "") << why;
    EXPECT_EQ(found.line, 0U) << why;
}

// A row says what is wrong, and where.
template <typename Row>
void expectProblem(const platform::PropertyListExamination& found,
                   platform::PropertyListFormat format, const Row& row) {
    EXPECT_FALSE(found.value) << row.why;
    EXPECT_EQ(found.format, format) << row.why;
    EXPECT_EQ(found.problem, row.problem) << row.why;
    EXPECT_EQ(found.line, row.line) << row.why;
    EXPECT_EQ(found.column, row.column) << row.why;
}

}  // namespace vlm::test
