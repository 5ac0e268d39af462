// SPDX-License-Identifier: MIT
// What an Info.plist calls its executable, friendly and hostile documents alike.
#include <optional>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "platform/linux/info_plist.h"
#include "platform/linux/xml_entities.h"

namespace {

using core_foundation::bundleExecutableKey;
using testing::Eq;
using testing::Optional;

const std::string kHead =
    "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
    "<!DOCTYPE plist PUBLIC \"-//Apple//DTD PLIST 1.0//EN\" "
    "\"http://www.apple.com/DTDs/PropertyList-1.0.dtd\">\n";

// A whole property list around the content of its outermost dict.
std::string plist(const std::string& dict) {
  return kHead + "<plist version=\"1.0\">\n<dict>\n" + dict + "\n</dict>\n</plist>\n";
}

struct PlistCase {
  const char* name;
  std::string document;
  std::optional<std::string> executable;
};
class BundleExecutableKey : public testing::TestWithParam<PlistCase> {};

TEST_P(BundleExecutableKey, IsReadFromTheOutermostDict) {
  EXPECT_EQ(bundleExecutableKey(GetParam().document), GetParam().executable);
}

const std::string kKey = "<key>CFBundleExecutable</key>";
const std::string kPair = kKey + "<string>ProM</string>";
const std::string kOther = "<key>CFBundleName</key><string>Other</string>";

INSTANTIATE_TEST_SUITE_P(
    Friendly, BundleExecutableKey,
    testing::Values(
        PlistCase{"Alone", plist(kPair), "ProM"},
        PlistCase{"AmongOthers", plist(kOther + kPair + "<key>LSRequiresCarbon</key><true/>"), "ProM"},
        PlistCase{"WhiteSpace", plist(kKey + "\r\n\t <string>\n\t ProM \n</string>"), "ProM"},
        PlistCase{"WhiteSpaceInKey", plist("<key> CFBundleExecutable\n</key><string>P</string>"), "P"},
        PlistCase{"BlankInside", plist(kKey + "<string>Pro M</string>"), "Pro M"},
        PlistCase{"Comments", plist("<!-- <key>x -->" + kKey + "<!-- --><string>Pr<!-- < -->oM</string>"),
                  "ProM"},
        PlistCase{"Entities", plist(kKey + "<string>A&amp;B &lt;&gt;&quot;&apos;</string>"), "A&B <>\"'"},
        PlistCase{"References", plist(kKey + "<string>&#80;&#x72;&#xE4;&#x20AC;&#x1F3B9;</string>"),
                  "Pr\xC3\xA4\xE2\x82\xAC\xF0\x9F\x8E\xB9"},
        PlistCase{"LiteralText", plist(kKey + "<string><![CDATA[A&B<C>]]></string>"), "A&B<C>"},
        PlistCase{"NonAscii",
                  plist(kKey + "<string>\xC3\x9C"
                               "ber</string>"),
                  "\xC3\x9C"
                  "ber"},
        PlistCase{"ByteOrderMark", "\xEF\xBB\xBF" + plist(kPair), "ProM"},
        PlistCase{"NoHead", "<plist><dict>" + kPair + "</dict></plist>", "ProM"},
        PlistCase{"AngleBracketInAttribute", "<plist v='>'><dict>" + kPair + "</dict></plist>", "ProM"},
        PlistCase{"DocumentTypeWithDefinitions",
                  "<!DOCTYPE plist [<!ENTITY a \"b\">]><plist><dict>" + kPair + "</dict></plist>", "ProM"},
        PlistCase{"NestedDictDoesNotCount",
                  plist("<key>Inner</key><dict>" + kKey + "<string>Wrong</string></dict>" + kPair), "ProM"},
        PlistCase{"TheFirstOfTwoCounts", plist(kPair + kKey + "<string>Second</string>"), "ProM"}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Absent, BundleExecutableKey,
    testing::Values(
        PlistCase{"NoKey", plist(kOther), std::nullopt}, PlistCase{"EmptyDict", plist(""), std::nullopt},
        PlistCase{"OnlyInNestedDict", plist("<key>I</key><dict>" + kPair + "</dict>"), std::nullopt},
        PlistCase{"OnlyInArray", "<plist><array>" + kPair + "</array></plist>", std::nullopt},
        PlistCase{"OnlyInDictInArray", "<plist><array><dict>" + kPair + "</dict></array></plist>",
                  std::nullopt},
        PlistCase{"EmptyString", plist(kKey + "<string></string>"), std::nullopt},
        PlistCase{"EmptyElement", plist(kKey + "<string/>"), std::nullopt},
        PlistCase{"BlankString", plist(kKey + "<string> \n </string>"), std::nullopt},
        PlistCase{"ANumber", plist(kKey + "<integer>7</integer>"), std::nullopt},
        PlistCase{"AnArrayOfStrings", plist(kKey + "<array><string>ProM</string></array>"), std::nullopt},
        PlistCase{"AnElementInTheString", plist(kKey + "<string>Pro<b/>M</string>"), std::nullopt},
        PlistCase{"KeyWithoutValue", plist(kKey), std::nullopt},
        PlistCase{"AnotherKeyFollows", plist(kKey + kOther), std::nullopt},
        PlistCase{"KeyInOtherCapitals", plist("<key>cfbundleexecutable</key><string>P</string>"),
                  std::nullopt},
        PlistCase{"CommentedOut", plist("<!--" + kPair + "-->"), std::nullopt}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Hostile, BundleExecutableKey,
    testing::Values(PlistCase{"Empty", "", std::nullopt}, PlistCase{"Text", "ProM\n", std::nullopt},
                    PlistCase{"Binary",
                              std::string("bplist00\xD1\x01\x02_\x10\x12"
                                          "CFBundleExecutable\0\0",
                                          33),
                              std::nullopt},
                    PlistCase{"Utf16", std::string("\xFF\xFE<\0p\0l\0i\0s\0t\0", 14), std::nullopt},
                    PlistCase{"ZeroByte", plist(kPair) + std::string(1, '\0'), std::nullopt},
                    PlistCase{"NotUtf8", plist(kKey + "<string>caf\xE9</string>"), std::nullopt},
                    PlistCase{"AnotherRoot", "<html><dict>" + kPair + "</dict></html>", std::nullopt},
                    PlistCase{"NoDict", "<plist>" + kPair + "</plist>", std::nullopt},
                    PlistCase{"Truncated", kHead + "<plist><dict>" + kPair, std::nullopt},
                    PlistCase{"TruncatedInTag", kHead + "<plist><dict>" + kPair + "</di", std::nullopt},
                    PlistCase{"TruncatedInComment", plist(kPair) + "<!-- ", std::nullopt},
                    PlistCase{"TruncatedInInstruction", plist(kPair) + "<?xml ", std::nullopt},
                    PlistCase{"TruncatedInLiteralText", plist(kKey + "<string><![CDATA[ProM</string>"),
                              std::nullopt},
                    PlistCase{"TruncatedInDocumentType", "<!DOCTYPE plist", std::nullopt},
                    PlistCase{"TruncatedInDefinitions", "<!DOCTYPE plist [ <!ENTITY", std::nullopt},
                    PlistCase{"TruncatedInQuotes", "<plist version=\"1.0><dict>" + kPair, std::nullopt},
                    PlistCase{"LoneAngleBracket", "<", std::nullopt},
                    PlistCase{"EmptyTag", "<></>", std::nullopt},
                    PlistCase{"CrossedTags", "<plist><dict>" + kPair + "</plist></dict>", std::nullopt},
                    PlistCase{"ClosedTwice", plist(kPair) + "</plist>", std::nullopt},
                    PlistCase{"EntityOfItsOwn",
                              "<!DOCTYPE plist [<!ENTITY a \"ProM\">]><plist><dict>" + kKey +
                                  "<string>&a;</string></dict></plist>",
                              std::nullopt},
                    PlistCase{"DeepNesting", "<plist><dict>" + std::string(200000, '<'), std::nullopt}),
    [](const auto& test) { return test.param.name; });

TEST(BundleExecutableKey, IsFoundBehindDeepNesting) {
  std::string deep;
  for (int i = 0; i < 50000; ++i) deep += "<a>";
  for (int i = 0; i < 50000; ++i) deep += "</a>";
  EXPECT_THAT(bundleExecutableKey(plist("<key>Deep</key>" + deep + kPair)), Optional(Eq("ProM")));
}

TEST(BundleExecutableKey, EveryBeginningOfADocumentIsAbsent) {
  const std::string whole = "<plist><dict>" + kPair + "</dict></plist>";
  for (std::size_t size = 0; size < whole.size(); ++size)
    EXPECT_EQ(bundleExecutableKey(whole.substr(0, size)), std::nullopt) << size;
  EXPECT_THAT(bundleExecutableKey(whole), Optional(Eq("ProM")));
}

class ResolveEntitiesRefused : public testing::TestWithParam<const char*> {};

TEST_P(ResolveEntitiesRefused, GivesNothing) {
  EXPECT_EQ(core_foundation::resolveEntities(GetParam()), std::nullopt);
}

INSTANTIATE_TEST_SUITE_P(Table, ResolveEntitiesRefused,
                         testing::Values("&", "a&", "&;", "&amp", "&nbsp;", "&AMP;", "&#;", "&#x;", "&#0;",
                                         "&#-1;", "&#xD800;", "&#xDFFF;", "&#x110000;", "&#99999999999;",
                                         "&#12a;", "&# 65;"));

}  // namespace
