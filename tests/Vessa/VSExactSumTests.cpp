#include "Vessa/VSExactSum.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <vector>

namespace {

double randomDouble(std::mt19937_64& random) {
    const double mantissa = static_cast<double>(static_cast<int64_t>(random()));
    return std::ldexp(mantissa, static_cast<int>(random() % 90) - 63 - 60 + 16);
}

}  // namespace

TEST(VSExactSum, KeepsEveryDoubleAndItsBytes) {
    std::mt19937_64 random(1);
    std::vector<double> values{0,      1,       -1,       255,     256,    -256,    -128,       0.1,
                               2.4e-6, 0x1p-60, 0x1.8p46, -0x1p46, 0x1p62, -0x1p55, 65535.0625, 0.061};
    for (int i = 0; i < 20000; ++i) values.push_back(randomDouble(random));
    for (double value : values) {
        if (value != 0 && std::fabs(value) < 0x1p-60) continue;
        const VSExactSum sum(value);
        ASSERT_EQ(sum.value(), value);
        std::string bytes;
        sum.appendTo(bytes);
        const size_t length = bytes.size();
        for (const char* behind : {"", "behind it"}) {
            const std::string text = bytes + behind;
            const char* next = text.data();
            VSExactSum read(7);
            ASSERT_TRUE(read.readFrom(next, text.data() + text.size())) << value;
            ASSERT_EQ(read, sum) << value;
            ASSERT_EQ(next, text.data() + length);
        }
        const char* next = bytes.data();
        VSExactSum read;
        ASSERT_FALSE(read.readFrom(next, bytes.data() + length - 1)) << "cut short: " << value;
    }
}

TEST(VSExactSum, DoesNotRoundBeforeTheEnd) {
    VSExactSum sum;
    for (double value : {1e14, 0.1, -1e14, 3e-10, 0x1p-60}) sum += VSExactSum(value);
    EXPECT_EQ(sum.value(), 0.1 + 3e-10);
    sum -= VSExactSum(0.1);
    EXPECT_EQ(sum.value(), 3e-10 + 0x1p-60);
    // To the nearest, of two equally near the even one, however small the rest is.
    const VSExactSum tie = VSExactSum(0x1p53) + VSExactSum(1);
    EXPECT_EQ(tie.value(), 0x1p53);
    EXPECT_EQ((tie + VSExactSum(0x1p-100)).value(), 0x1p53 + 2);
    EXPECT_EQ((tie - VSExactSum(0x1p-100)).value(), 0x1p53);
    EXPECT_EQ((VSExactSum(0.1) + VSExactSum(0.1) + VSExactSum(0.1)).dividedBy(3), 0.1);
    EXPECT_EQ(VSExactSum(1).dividedBy(3), 1.0 / 3);
    EXPECT_EQ(VSExactSum(-2).dividedBy(3), -2.0 / 3);
}

TEST(VSExactSum, PartsOfASpanAddUpToItsValue) {
    std::mt19937_64 random(2);
    for (int round = 0; round < 5000; ++round) {
        const double value = randomDouble(random);
        const auto duration = static_cast<int64_t>(random() >> (5 + random() % 50)) + 1;
        const VSExactSpan span(value, duration);
        int64_t reached = 0;
        VSExactSum sum;
        while (reached < duration) {
            const int64_t next =
                reached + 1 + static_cast<int64_t>(random() % static_cast<uint64_t>(duration - reached));
            const VSExactSum part = span.part(reached, next);
            const double expected =
                value * (static_cast<double>(next - reached) / static_cast<double>(duration));
            ASSERT_NEAR(part.value(), expected, 1e-15 * std::fabs(expected) + 1e-33);
            sum += part;
            reached = next;
        }
        ASSERT_EQ(sum, VSExactSum(value));
    }
}
