#include "Vessa/Base/VSValue.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <random>

#include "Vessa/Base/VSLog.h"

namespace {

/// Any value, nested up to so deep.
VSValue randomValue(std::mt19937_64& random, int depth) {
    const auto text = [&random] {
        std::string result;
        for (uint64_t i = random() % 12; i > 0; --i) result += static_cast<char>(random() % 256);
        return result;
    };
    switch (random() % (depth > 0 ? 8 : 6)) {
        case 0:
            return VSValue(text());
        case 1:
            return VSValue(random() % 2 == 0);
        case 2:
            return VSValue(static_cast<int64_t>(random()));
        case 3: {
            const uint64_t bits = random();
            double real = 0;
            memcpy(&real, &bits, sizeof real);
            return VSValue(std::isnan(real) ? 2.0 : real);
        }
        case 4:
            return VSValue(VSDate::fromMicroseconds(static_cast<int64_t>(random()) / 4));
        case 5: {
            const std::string bytes = text();
            return VSValue(VSValue::Data(bytes.begin(), bytes.end()));
        }
        case 6: {
            VSValue::Array array;
            for (uint64_t i = random() % 4; i > 0; --i) array.push_back(randomValue(random, depth - 1));
            return VSValue(std::move(array));
        }
        default: {
            VSValue::Dictionary dictionary;
            for (uint64_t i = random() % 4; i > 0; --i)
                dictionary.emplace(text(), randomValue(random, depth - 1));
            return VSValue(std::move(dictionary));
        }
    }
}

TEST(VSValue, SerializesWithoutLoss) {
    std::mt19937_64 random(2);
    for (int i = 0; i < 20'000; ++i) {
        const VSValue value = randomValue(random, 3);
        const std::string text = value.serialized();
        ASSERT_EQ(text.find('\n'), std::string::npos);
        ASSERT_EQ(VSValue::fromSerialized(text), value) << text;
    }
    for (const double special :
         {HUGE_VAL, -HUGE_VAL, -0.0, 1.0, 1e300, std::numeric_limits<double>::denorm_min()}) {
        const auto back = VSValue::fromSerialized(VSValue(special).serialized());
        ASSERT_TRUE(back && !back->integer() && back->number());
        EXPECT_EQ(std::signbit(*back->number()), std::signbit(special));
        EXPECT_EQ(*back->number(), special);
    }
    EXPECT_TRUE(std::isnan(*VSValue::fromSerialized(VSValue(std::nan("")).serialized())->number()));
}

TEST(VSValue, TheFormOnDiskStaysAsItIs) {
    const VSValue value(VSValue::Dictionary{{"a", 1},
                                            {"b", 1.0},
                                            {"c", VSValue::Array{true, "x\"\n", VSDate::fromSeconds(1)}},
                                            {"d", VSValue::Data{0, 255}}});
    const char* text =
        R"({"dict":{"a":1,"b":1.0,"c":[true,"x\"\u000a",{"date":1000000}],"d":{"data":"00ff"}}})";
    EXPECT_EQ(value.serialized(), text);
    EXPECT_EQ(VSValue::fromSerialized(text), value);
    EXPECT_EQ(VSValue::fromSerialized(" [ \"\\u00e6\\ud83d\\ude00\\t\" ,\n2 ] "),
              VSValue(VSValue::Array{"\u00e6\U0001F600\t", 2}));
}

TEST(VSValue, RefusesOtherTexts) {
    // clang-format off
    const char* const texts[] = {
        "", "x", "nul", "null", "tru", "1x", "1 2", "-", "+1", "99999999999999999999", "\"", "\"\\q\"",
        "\"\\ud800\"", "\"\\udc00\"", "\"\\u12\"", "\"a\nb\"", "[", "[1", "[1,]", "[1 2]", "{}",
        "{\"a\":1}", "{\"dict\":1}", "{\"dict\":{\"a\":1,\"a\":2}}", "{\"dict\":{\"a\"}}",
        "{\"dict\":{}", "{\"date\":1.5}", "{\"date\":\"1\"}", "{\"data\":\"0\"}", "{\"data\":\"0g\"}",
        "{\"data\":\"-1\"}", "{\"real\":\"NaN\"}", "{\"dict\":{}}}"};
    // clang-format on
    for (const char* text : texts) EXPECT_FALSE(VSValue::fromSerialized(text)) << text;
    EXPECT_FALSE(VSValue::fromSerialized(std::string(100'000, '[')));
}

TEST(VSValue, DescribesItselfForDocuments) {
    EXPECT_EQ(VSValue("as it is\\").description(), "as it is\\");
    EXPECT_EQ(VSValue(true).description(), "1");
    EXPECT_EQ(VSValue(false).description(), "0");
    EXPECT_EQ(VSValue(-7).description(), "-7");
    EXPECT_EQ(VSValue(0.1).description(), "0.1");
    EXPECT_EQ(VSValue(79.93333333333334).description(), "79.93333333333334");
    EXPECT_EQ(VSValue(325.0).description(), "325");
    EXPECT_EQ(VSValue(VSDate::fromMicroseconds(500'000)).description(), "1970-01-01T00:00:00.500000+00:00");
    EXPECT_EQ(VSValue(VSValue::Data{1, 0xAB}).description(), "01ab");
    EXPECT_EQ(VSValue(VSValue::Array{1, "a"}).description(), "[1,\"a\"]");
}

TEST(VSValue, AnswersOnlyForItsKind) {
    const VSValue integer(3), real(3.5), dictionary(VSValue::Dictionary{{"key", 1}});
    EXPECT_EQ(integer.number(), 3.0);
    EXPECT_FALSE(real.integer());
    EXPECT_FALSE(integer.boolean());
    EXPECT_FALSE(integer.date());
    EXPECT_EQ(integer["key"], nullptr);
    ASSERT_NE(dictionary["key"], nullptr);
    EXPECT_EQ(*dictionary["key"], VSValue(1));
    EXPECT_EQ(dictionary["other"], nullptr);
    EXPECT_EQ(VSValue(), VSValue(""));
    EXPECT_NE(VSValue(1), VSValue(1.0));
    EXPECT_NE(VSValue(1), VSValue(true));
}

TEST(VSLog, LinesGoToTheSinkInForce) {
    std::vector<std::pair<VSLogLevel, std::string>> lines;
    const auto before =
        VSSetLogSink([&lines](VSLogLevel level, std::string_view line) { lines.emplace_back(level, line); });
    VSLog(VSLogLevel::Error, "bad");
    EXPECT_TRUE(VSLogIsEnabled(VSLogLevel::Debug));
    VSLog(VSLogLevel::Debug, "detail");
    const auto ours = VSSetLogSink(before);
    EXPECT_TRUE(ours);
    EXPECT_TRUE(VSLogIsEnabled(VSLogLevel::Error));
    EXPECT_EQ(lines, (std::vector<std::pair<VSLogLevel, std::string>>{{VSLogLevel::Error, "bad"},
                                                                      {VSLogLevel::Debug, "detail"}}));
}

}  // namespace
