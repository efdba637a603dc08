#include "Vessa/VSSource.h"

#include <gtest/gtest.h>

#include <random>

namespace {

VSDevice device(std::optional<std::string> name, std::optional<std::string> hardware = {}) {
    VSDevice result;
    result.name = std::move(name);
    result.hardwareVersion = std::move(hardware);
    return result;
}

TEST(VSSource, ImportedNames) {
    EXPECT_EQ(VSSource::forImportedName("Scale"), (VSSource{"Scale", "import.Scale"}));
    EXPECT_TRUE(VSSource::forImportedName(VSSource::application().name).isApplication());
    EXPECT_FALSE(VSSource::forImportedName("").isApplication());
}

TEST(VSDevice, DescribesItself) {
    EXPECT_EQ(device("Wrist tracker", "1").description(), "name:Wrist tracker, hardware:1");
    EXPECT_EQ(device("a, b: \\c").description(), "name:a\\, b\\: \\\\c");
    EXPECT_EQ(device({}).description(), "");
    EXPECT_EQ(device("").description(), "name:");
}

TEST(VSDevice, EveryDescriptionReadsBack) {
    std::mt19937 random(6);
    const auto field = [&random]() -> std::optional<std::string> {
        if (random() % 3 == 0) return std::nullopt;
        std::string text;
        for (unsigned i = random() % 8; i > 0; --i) text += ",: \\abname\n"[random() % 11];
        return text;
    };
    for (int i = 0; i < 20'000; ++i) {
        const VSDevice original{field(), field(), field(), field(), field(), field(), field(), field()};
        ASSERT_EQ(VSDevice::fromDescription(original.description()), original) << original.description();
    }
}

TEST(VSDevice, OtherTextsBecomeItsName) {
    for (const char* text :
         {"Scale", "name", "name:a, b", "colour:red", "name:a, name:b", "hardware:1, name:a",
          "name:a,hardware:1", "name:a\\", "name:a\\b", "name:a:b", "<<x: 0x1>, name:y>"}) {
        const VSDevice named = VSDevice::fromDescription(text);
        EXPECT_EQ(named, device(text));
        EXPECT_EQ(VSDevice::fromDescription(named.description()), named);
    }
}

}  // namespace
