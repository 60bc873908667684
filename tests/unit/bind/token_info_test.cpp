#include "bind/token_info.h"

#include <gtest/gtest.h>

namespace vlm {
namespace {

using platform::Bytes;
using platform::PropertyList;
using Array = PropertyList::Array;
using Dictionary = PropertyList::Dictionary;
using Hashes = std::vector<Bytes>;

const Bytes kOne{1};
const Bytes kTwo{2};
const Bytes kThree{3};

TokenInfo read(Dictionary record) { return TokenInfo(PropertyList(std::move(record))); }

bool isEmpty(const TokenInfo& info) {
    return info.tokens.empty() && info.tokenByHash.empty() && info.hashesByToken.empty() &&
           info.offered.empty() && info.bound.empty() && info.names.empty() &&
           info.wrapKeys.empty() && info.cardNames.empty() && info.boundHashes.empty() &&
           info.authentication.empty();
}

TEST(TokenInfo, PairsUpEveryPairOfArrays) {
    const auto info = read({{"tnh", Array{kOne, kTwo}},
                            {"tni", Array{"card", "card"}},
                            {"unk", Array{kOne}},
                            {"unv", Array{"offered"}},
                            {"hsk", Array{kTwo}},
                            {"hsv", Array{"bound"}},
                            {"uth", Array{kThree}},
                            {"uti", Array{"card"}},
                            {"fnh", Array{kOne, kTwo}},
                            {"fni", Array{"first", "second"}}});

    EXPECT_EQ(info.tokenByHash, (TokenInfo::TextByHash{{kOne, "card"}, {kTwo, "card"}}));
    EXPECT_EQ(info.hashesByToken.at("card"), (Hashes{kOne, kTwo}));
    EXPECT_EQ(info.offered, (TokenInfo::TextByHash{{kOne, "offered"}}));
    EXPECT_EQ(info.bound, (TokenInfo::TextByHash{{kTwo, "bound"}}));
    EXPECT_EQ(info.boundHashes, Hashes{kTwo});
    EXPECT_EQ(info.wrapKeys, (TokenInfo::TextByHash{{kThree, "card"}}));
    EXPECT_EQ(info.names, (TokenInfo::TextByHash{{kOne, "first"}, {kTwo, "second"}}));
}

TEST(TokenInfo, TakesTheDictionariesAsTheyStand) {
    const auto info = read({{"hsh", Dictionary{{"bob", kTwo}, {"alice", kOne}}},
                            {"ftn", Dictionary{{"card", "My Card"}}}});

    EXPECT_EQ(info.authentication,
              (std::vector<std::pair<std::string, Bytes>>{{"bob", kTwo}, {"alice", kOne}}));
    EXPECT_EQ(info.cardNames, (std::map<std::string, std::string>{{"card", "My Card"}}));
}

TEST(TokenInfo, NamesEachTokenOnceAndSorted) {
    const auto info = read({{"tnh", Array{kOne, kTwo, kThree}}, {"tni", Array{"b", "a", "b"}}});

    EXPECT_EQ(info.tokens, (std::vector<std::string>{"a", "b"}));
}

TEST(TokenInfo, AKeyThatComesTwiceKeepsItsLastValue) {
    const auto info = read({{"tnh", Array{kOne, kOne}}, {"tni", Array{"first", "last"}}});

    EXPECT_EQ(info.tokenByHash, (TokenInfo::TextByHash{{kOne, "last"}}));
    EXPECT_FALSE(info.hashesByToken.contains("first"));
}

TEST(TokenInfo, ShowsNamesOfAnyTypeInTheirTextForm) {
    const auto info = read({{"unk", Array{kOne, kTwo}},
                            {"unv", Array{7, true}},
                            {"hsk", Array{kOne}},
                            {"hsv", Array{Bytes{0xAB}}},
                            {"fnh", Array{kOne}},
                            {"fni", Array{PropertyList(Array{1, 2})}},
                            {"ftn", Dictionary{{"card", 5}}}});

    EXPECT_EQ(info.offered, (TokenInfo::TextByHash{{kOne, "7"}, {kTwo, "true"}}));
    EXPECT_EQ(info.bound, (TokenInfo::TextByHash{{kOne, "<AB>"}}));
    EXPECT_EQ(info.names, (TokenInfo::TextByHash{{kOne, "[1, 2]"}}));
    EXPECT_EQ(info.cardNames.at("card"), "5");
}

struct OddRecord {
    const char* why;
    PropertyList record;
};

TEST(TokenInfo, SaysNothingForARecordThatSaysNothing) {
    const OddRecord rows[] = {
        {"no entries", Dictionary{}},
        {"text", "tnh"},
        {"an array", Array{kOne}},
        {"bytes", kOne},
        {"a number", 7},
        {"a boolean", true},
        {"a date", PropertyList::Date{1}},
        {"other keys", Dictionary{{"TNH", Array{kOne}}, {"", Array{"card"}}}},
        {"texts where arrays belong", Dictionary{{"tnh", "x"}, {"tni", "card"}, {"hsk", "x"}}},
        {"dictionaries where arrays belong", Dictionary{{"tni", Dictionary{{"card", kOne}}}}},
        {"arrays where dictionaries belong", Dictionary{{"hsh", Array{kOne}}, {"ftn", Array{"x"}}}},
        {"hashes that are no bytes", Dictionary{{"unk", Array{"x", 1, Array{}, Dictionary{}}},
                                                {"unv", Array{"a", "b", "c", "d"}},
                                                {"hsk", Array{"x", 1}},
                                                {"hsv", Array{"a", "b"}}}},
        {"tokens that are no text",
         Dictionary{{"tnh", Array{kOne, kTwo}}, {"tni", Array{7, Bytes{1}}}}},
        {"wrap keys' tokens that are no text", Dictionary{{"uth", Array{kOne}}, {"uti", Array{7}}}},
        {"authentication by what is no hash", Dictionary{{"hsh", Dictionary{{"alice", "x"}}}}},
        {"keys without values", Dictionary{{"tnh", Array{kOne}}, {"unk", Array{kOne}}}},
        {"values without keys", Dictionary{{"unv", Array{"name"}}, {"hsv", Array{"name"}}}},
    };
    for (const auto& row : rows) EXPECT_TRUE(isEmpty(TokenInfo(row.record))) << row.why;
}

TEST(TokenInfo, PassesOverWrongElementsAndKeepsTheOthers) {
    const auto info = read({{"tnh", Array{kOne, "x", kThree}},
                            {"tni", Array{"card", "odd", 5}},
                            {"hsk", Array{1, kTwo}},
                            {"hsv", Array{"a", "b"}},
                            {"hsh", Dictionary{{"alice", 1}, {"bob", kOne}}}});

    EXPECT_EQ(info.tokenByHash, (TokenInfo::TextByHash{{kOne, "card"}}));
    EXPECT_EQ(info.tokens, (std::vector<std::string>{"card", "odd"}));
    EXPECT_EQ(info.bound, (TokenInfo::TextByHash{{kTwo, "b"}}));
    EXPECT_EQ(info.authentication.size(), 1U);
}

TEST(TokenInfo, TheShorterArrayOfAPairCounts) {
    const auto longKeys = read({{"unk", Array{kOne, kTwo}}, {"unv", Array{"a"}}});
    const auto longValues = read({{"unk", Array{kOne}}, {"unv", Array{"a", "b"}}});

    EXPECT_EQ(longKeys.offered, (TokenInfo::TextByHash{{kOne, "a"}}));
    EXPECT_EQ(longValues.offered, (TokenInfo::TextByHash{{kOne, "a"}}));
}

TEST(TokenInfo, ABoundHashIsListedAlsoWithoutAnythingToShow) {
    const auto info = read({{"hsk", Array{kOne, kTwo}}, {"hsv", Array{"a"}}});

    EXPECT_EQ(info.boundHashes, (Hashes{kOne, kTwo}));
}

TEST(TokenInfo, AnEmptyHashIsAHashLikeAnyOther) {
    const auto info = read({{"tnh", Array{Bytes{}}}, {"tni", Array{"card"}}});

    EXPECT_EQ(info.tokenByHash, (TokenInfo::TextByHash{{Bytes{}, "card"}}));
}

}  // namespace
}  // namespace vlm
