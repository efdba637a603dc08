#include "Vessa/VSUnit.h"

#include <gtest/gtest.h>

#include <cmath>
#include <random>
#include <thread>

namespace {

double converted(double value, const char* from, const char* to) {
    return VSUnit::fromString(from).convert(value, VSUnit::fromString(to)).value_or(std::nan(""));
}

std::string canonical(const char* text) {
    const auto unit = VSUnit::parse(text);
    return unit ? unit->unitString() : unit.error().message;
}

TEST(VSUnit, CanonicalTexts) {
    const char* const canonicalOnes[] = {"count/min",   "mmHg",     "mg/dL", "mmol/L", "mmol<180.1558>/L",
                                         "degC",        "ft",       "lb",    "kcal",   "cal",
                                         "mL/(kg*min)", "km/hr",    "m/s^2", "%",      "IU",
                                         "mcg",         "fl_oz_us", "1/min", "1",      "dBASPL",
                                         "cmAq",        "mcS"};
    for (const char* text : canonicalOnes) EXPECT_EQ(canonical(text), text);
    // clang-format off
    const std::pair<const char*, const char*> others[] = {
        {"mmol<180.15580>/L", "mmol<180.1558>/L"}, {"mol<018.0>", "mol<18>"}, {"Cal", "kcal"},
        {"mL/kg/min", "mL/(kg*min)"}, {"mL/min/kg", "mL/(kg*min)"}, {"mL/min*kg", "kg*mL/min"},
        {"m.s^-2", "m/s^2"}, {"\u00B5g", "mcg"}, {"\u03BCg", "mcg"}, {"kg\u00B7m/s^2", "kg*m/s^2"},
        {"(m/s)^2", "m^2/s^2"}, {"s^-1", "1/s"}, {"m/m", "1"}, {"m*m", "m^2"}, {"(degC)", "degC"},
        {"((kg))/(1/m)", "kg*m"}, {"g/m^0", "g"}};
    // clang-format on
    for (const auto& [text, expected] : others) EXPECT_EQ(canonical(text), expected) << text;
}

TEST(VSUnit, RefusesGarbageAndSaysWhere) {
    const std::pair<const char*, int> cases[] = {
        {"", 1},          {"xyz", 1},    {"count/", 7},    {"count//min", 7}, {"/min", 1},
        {"count min", 6}, {" kg", 1},    {"kg ", 3},       {"kg)", 3},        {"(kg", 4},
        {"()", 2},        {"m^", 3},     {"m^x", 3},       {"m^10", 3},       {"m^99999999999", 3},
        {"m^2^2", 4},     {"mol<>", 5},  {"mol<x>", 5},    {"mol<0>", 5},     {"mol<-1>", 5},
        {"mol<1", 5},     {"g<18>", 3},  {"mol<1e3>", 5},  {"mol<1.>", 5},    {"cd", 1},
        {"h", 1},         {"mft", 1},    {"kmin", 1},      {"kcount", 1},     {"mdegC", 1},
        {"k", 1},         {"kk", 1},     {"KG", 1},        {"ml", 1},         {"pt", 1},
        {"fl_oz", 1},     {"mmg", 1},    {"kkg", 1},       {"12", 2},         {"2*kg", 1},
        {"kg\xC2", 3},    {"\u00B5", 1}, {"kg*(m*(s)", 10}};
    for (const auto& [text, position] : cases) {
        const auto unit = VSUnit::parse(text);
        ASSERT_FALSE(unit.ok()) << text;
        EXPECT_EQ(unit.error().code, VSErrorCode::Invalid);
        EXPECT_NE(unit.error().message.find("(at character " + std::to_string(position) + ")"),
                  std::string::npos)
            << unit.error().message;
    }
    EXPECT_FALSE(VSUnit::parse(std::string(1000, '(') + "m" + std::string(1000, ')')).ok());
    EXPECT_FALSE(VSUnit::parse(std::string(20, '(') + "m" + std::string(20, ')')).ok());
    EXPECT_FALSE(VSUnit::parse(std::string("kg\0", 3)).ok());
    EXPECT_FALSE(VSUnit::parse("((m^9)^9)^9").ok());
}

// The numbers are the definitions themselves, multiplied out by hand.
TEST(VSUnit, ConversionsAreExactToTheDefinitions) {
    struct Case {
        double value;
        const char *from, *to;
        double expected;
    };
    // clang-format off
    const Case cases[] = {
        {1, "in", "mm", 25.4}, {1, "ft", "m", 0.3048}, {1, "yd", "m", 0.9144}, {1, "mi", "m", 1609.344},
        {1, "mi", "ft", 5280}, {1, "lb", "kg", 0.45359237}, {1, "oz", "g", 28.349523125},
        {1, "st", "kg", 6.35029318}, {1, "st", "lb", 14}, {1, "fl_oz_us", "mL", 29.5735295625},
        {1, "cup_us", "fl_oz_us", 8}, {1, "pt_us", "mL", 473.176473},
        {1, "fl_oz_imp", "mL", 28.4130625}, {1, "cup_imp", "fl_oz_imp", 10},
        {1, "pt_imp", "mL", 568.26125}, {1, "L", "m^3", 0.001}, {1, "kcal", "kJ", 4.184},
        {1, "Cal", "cal", 1000}, {1, "J", "kg*m^2/s^2", 1}, {1, "mmHg", "Pa", 133.322387415},
        {1, "atm", "kPa", 101.325}, {1, "V*S", "J/(V*s)", 1}, {1, "Hz", "1/min", 60},
        {72, "count/min", "count/s", 1.2}, {36, "km/hr", "m/s", 10},
        {1, "mmol<180.1558>/L", "mg/dL", 18.01558}, {100, "%", "%", 100},
        // Letters that could mean two things: no milli-inches, centi-anything or micro-"al".
        {1, "min", "s", 60}, {1, "cmAq", "Pa", 98.0665}, {1, "mcal", "cal", 0.001},
        {1, "mccal", "cal", 0.000001}, {1, "dam", "m", 10}, {1, "dm", "m", 0.1}, {1, "hPa", "Pa", 100},
        {1, "d", "hr", 24}, {1, "Mg", "mg", 1e9},
        // Temperatures have their zeros only alone.
        {0, "degC", "degF", 32}, {100, "degC", "degF", 212}, {-40, "degF", "degC", -40},
        {37, "degC", "degF", 98.6}, {98.6, "degF", "degC", 37}, {0, "degC", "K", 273.15},
        {1, "degC/min", "degF/min", 1.8}, {0, "degC*count", "degF*count", 0}};
    // clang-format on
    for (const auto& [value, from, to, expected] : cases)
        EXPECT_EQ(converted(value, from, to), expected) << value << " " << from << " in " << to;
}

TEST(VSUnit, WhatDoesNotConvert) {
    const std::pair<const char*, const char*> cases[] = {{"count", "%"},  {"mmol/L", "mg/dL"}, {"IU", "mcg"},
                                                         {"dBASPL", "1"}, {"count/min", "Hz"}, {"S", "s"},
                                                         {"ms", "mS"},    {"kg", "m"}};
    for (const auto& [from, to] : cases) {
        EXPECT_FALSE(VSUnit::fromString(from).isCompatibleWith(VSUnit::fromString(to))) << from << " " << to;
        EXPECT_TRUE(std::isnan(converted(1, from, to))) << from << " " << to;
    }
    EXPECT_TRUE(VSUnit::fromString("km/m").isCompatibleWith(VSUnit::percentUnit()));
}

/// A unit string of random factors.
std::string randomUnitText(std::mt19937& random, int depth) {
    static const char* const symbols[] = {
        "g",    "kg", "mcg",  "m",  "cm",    "L",  "mL",       "s",    "min",
        "hr",   "d",  "kcal", "J",  "count", "%",  "degC",     "degF", "K",
        "mmHg", "ft", "in",   "lb", "oz",    "st", "fl_oz_us", "mol",  "mmol<180.1558>",
        "IU",   "S",  "V",    "Hz", "1"};
    std::string text;
    for (unsigned i = 0, n = 1 + random() % 3; i < n; ++i) {
        if (i > 0) text += "*/.*/"[random() % 5];
        if (depth > 0 && random() % 4 == 0)
            text += '(' + randomUnitText(random, depth - 1) + ')';
        else
            text += symbols[random() % std::size(symbols)];
        if (random() % 4 == 0) text += '^' + std::to_string(static_cast<int>(random() % 5) - 2);
    }
    return text;
}

TEST(VSUnit, CanonicalTextsReadBackAndConversionsReturn) {
    std::mt19937 random(4);
    int parsed = 0;
    for (int i = 0; i < 5000; ++i) {
        const std::string text = randomUnitText(random, 2);
        const auto unit = VSUnit::parse(text);
        if (!unit) continue;  // an exponent out of range
        ++parsed;
        const auto again = VSUnit::parse(unit->unitString());
        ASSERT_TRUE(again.ok()) << text << " -> " << unit->unitString();
        ASSERT_EQ(*again, *unit);
        ASSERT_EQ(again->unitString(), unit->unitString());
        if (*unit == VSUnit::fromString("degC") || *unit == VSUnit::fromString("degF"))
            continue;  // have a zero of their own
        const auto thousandfold = VSUnit::parse("(" + text + ")*km/m");
        ASSERT_TRUE(thousandfold.ok());
        ASSERT_DOUBLE_EQ(thousandfold->convert(1, *unit).value_or(0), 1000) << text;
        ASSERT_DOUBLE_EQ(unit->convert(1, *thousandfold).value_or(0), 0.001) << text;
    }
    EXPECT_GT(parsed, 4000);
}

TEST(VSUnit, ConversionsComeBack) {
    const std::vector<std::vector<const char*>> families{
        {"kg", "lb", "st", "oz", "g"},
        {"m", "ft", "in", "cm", "mi", "km", "yd"},
        {"degC", "degF", "K"},
        {"kcal", "kJ", "J", "cal"},
        {"mL", "fl_oz_us", "fl_oz_imp", "cup_us", "cup_imp", "pt_us", "pt_imp", "L"},
        {"mg/dL", "mmol<180.1558>/L"},
        {"mmHg", "cmAq", "kPa", "atm"}};
    std::mt19937 random(9);
    std::uniform_real_distribution<double> values(0.001, 1000);
    for (const auto& family : families)
        for (const char* from : family)
            for (const char* to : family)
                for (int i = 0; i < 50; ++i) {
                    const double value = values(random);
                    ASSERT_NEAR(converted(converted(value, from, to), to, from), value, 4e-13 + value * 4e-16)
                        << from << " " << to;
                }
}

TEST(VSUnit, ManyThreadsGetTheSameUnit) {
    std::vector<std::thread> threads;
    std::vector<const std::string*> texts(4);
    for (size_t t = 0; t < texts.size(); ++t)
        threads.emplace_back([&, t] {
            for (int i = 1; i < 300; ++i)
                texts[t] = &VSUnit::fromString("mol<" + std::to_string(i) + ">/L").unitString();
        });
    for (auto& thread : threads) thread.join();
    for (const std::string* text : texts) EXPECT_EQ(text, texts.front());
}

}  // namespace
