// SPDX-License-Identifier: MIT
#include <clocale>
#include <limits>
#include <string>

#include "describer/json_writer.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(JsonWriter, PutsEachMemberAndElementOnALineOfItsOwn) {
  JsonWriter json;
  json.beginObject();
  json.key("none");
  json.beginArray();
  json.endArray();
  json.key("some");
  json.beginArray();
  json.integer(-2147483648LL);
  json.beginObject();
  json.key("yes");
  json.boolean(true);
  json.key("no");
  json.boolean(false);
  json.endObject();
  json.null();
  json.endArray();
  json.endObject();
  EXPECT_EQ(json.document(),
            "{\n"
            "  \"none\": [],\n"
            "  \"some\": [\n"
            "    -2147483648,\n"
            "    {\n"
            "      \"yes\": true,\n"
            "      \"no\": false\n"
            "    },\n"
            "    null\n"
            "  ]\n"
            "}");
}

struct TextCase {
  const char* name;
  std::string text;
  const char* written;
  bool isLatin1;
};

class JsonWriterText : public testing::TestWithParam<TextCase> {};

TEST_P(JsonWriterText, IsQuotedAsUtf8) {
  JsonWriter json;
  json.text(GetParam().text);
  EXPECT_EQ(json.document(), GetParam().written);
  EXPECT_EQ(json.latin1Texts().size(), GetParam().isLatin1 ? 1U : 0U);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, JsonWriterText,
    testing::Values(TextCase{"Empty", "", "\"\"", false},
                    TextCase{"QuoteAndBackslash", "a\"b\\c", R"("a\"b\\c")", false},
                    TextCase{"ControlCharacters", "\x01\n\x1F\x7F", R"("\u0001\u000a\u001f\u007f")", false},
                    TextCase{"Utf8", "\xC3\xA4\xE2\x82\xAC", "\"\xC3\xA4\xE2\x82\xAC\"", false},
                    TextCase{"Latin1", "\xE4\xBF\xC0\xFF", "\"\xC3\xA4\xC2\xBF\xC3\x80\xC3\xBF\"", true},
                    TextCase{"Utf8CutInTheMiddle", "a\xC3", "\"a\xC3\x83\"", true}),
    [](const auto& row) { return row.param.name; });

TEST(JsonWriter, NamesThePlaceOfEachTextThatIsNotUtf8) {
  JsonWriter json;
  json.beginObject();
  json.key("name");
  json.text("\xE4");
  json.key("parameters");
  json.beginArray();
  json.text("plain");
  json.beginObject();
  json.key("label");
  json.text("\xFC");
  json.endObject();
  json.endArray();
  json.endObject();
  EXPECT_THAT(json.latin1Texts(), ElementsAre("/name", "/parameters/1/label"));
}

struct NumberCase {
  const char* name;
  float value;
  const char* written;
};

class JsonWriterNumber : public testing::TestWithParam<NumberCase> {};

TEST_P(JsonWriterNumber, IsAsShortAsGivesTheSameFloatAgain) {
  JsonWriter json;
  json.real(GetParam().value);
  EXPECT_EQ(json.document(), GetParam().written);
}

INSTANTIATE_TEST_SUITE_P(
    Numbers, JsonWriterNumber,
    testing::Values(NumberCase{"Zero", 0.0f, "0"}, NumberCase{"NegativeZero", -0.0f, "-0"},
                    NumberCase{"Tenth", 0.1f, "0.1"}, NumberCase{"Third", 1.0f / 3.0f, "0.33333334"},
                    NumberCase{"Largest", std::numeric_limits<float>::max(), "3.4028235e+38"},
                    NumberCase{"Smallest", std::numeric_limits<float>::denorm_min(), "1e-45"},
                    NumberCase{"Infinity", std::numeric_limits<float>::infinity(), "null"},
                    NumberCase{"NotANumber", std::numeric_limits<float>::quiet_NaN(), "null"}),
    [](const auto& row) { return row.param.name; });

}  // namespace
