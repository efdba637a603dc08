#include "Platform/PropertyList.h"

#include <gtest/gtest.h>

namespace {

std::string plist(const std::string& body) {
    return "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<plist version=\"1.0\">" + body + "</plist>\n";
}

VSValue read(const std::string& body) {
    const auto value = platform::readPropertyList(plist(body));
    EXPECT_TRUE(value.ok()) << value.error().message;
    return value.ok() ? *value : VSValue("unreadable");
}

TEST(PropertyList, ReadsEveryKindOfValue) {
    const VSValue value = read(
        "<!-- a comment --><dict><key>text</key><string>a &lt; b, "
        "\xC3\xA9</string><key>count</key><integer>-3</integer>"
        "<key>size</key><real>1.5</real><key>day</key><date>1986-04-12T00:00:00Z</date><key>yes</key><true/"
        "><key>no</key><false/>"
        "<key>bytes</key><data>AAEC "
        "/w==</data><key>list</key><array><integer>1</integer><dict/></array></dict>");
    EXPECT_EQ(*value["text"]->string(), "a < b, \xC3\xA9");
    EXPECT_EQ(value["count"]->integer(), -3);
    EXPECT_EQ(value["size"]->number(), 1.5);
    EXPECT_EQ(value["day"]->date(), VSDate::fromSeconds(513'648'000));
    EXPECT_EQ(value["yes"]->boolean(), true);
    EXPECT_EQ(value["no"]->boolean(), false);
    EXPECT_EQ(*value["bytes"]->data(), (VSValue::Data{0, 1, 2, 255}));
    ASSERT_EQ(value["list"]->array()->size(), 2u);
    EXPECT_TRUE(value["list"]->array()->at(1).dictionary()->empty());
}

TEST(PropertyList, RefusesWhatIsNotOne) {
    const char* const bodies[] = {
        "",
        "<string>a</string><string>b</string>",
        "<dict><string>no key</string></dict>",
        "<dict><key>a</key></dict>",
        "<dict><key>a</key><key>b</key><true/></dict>",
        "<dict><key>a</key><true/><key>a</key><false/></dict>",
        "<array><key>a</key></array>",
        "<array>text</array>",
        "<string>a<string>b</string></string>",
        "<integer>1.5</integer>",
        "<integer></integer>",
        "<real>nan</real>",
        "<real>1,5</real>",
        "<date>1986-02-30T00:00:00Z</date>",
        "<data>!</data>",
        "<colour>red</colour>",
        "<true>yes</true>",
        "<dict><key>a</key><true/>",
        "<string>&unknown;</string>",
    };
    for (const char* body : bodies) {
        const auto value = platform::readPropertyList(plist(body));
        ASSERT_FALSE(value.ok()) << body;
        EXPECT_EQ(value.error().code, VSErrorCode::Invalid) << body;
    }
    EXPECT_FALSE(platform::readPropertyList("").ok());
    EXPECT_FALSE(platform::readPropertyList("<dict/>").ok());
    const std::string deep(100, 'x');
    std::string nested;
    for (size_t i = 0; i < deep.size(); ++i) nested = "<array>" + nested + "</array>";
    EXPECT_FALSE(platform::readPropertyList(plist(nested)).ok());
}

TEST(PropertyList, EntitiesCannotBeDeclared) {
    const auto value = platform::readPropertyList(
        "<?xml version=\"1.0\"?><!DOCTYPE plist [<!ENTITY a \"aaaa\"><!ENTITY b SYSTEM "
        "\"file:///etc/passwd\">]>"
        "<plist><string>&a;&b;</string></plist>");
    ASSERT_FALSE(value.ok());
    EXPECT_NE(value.error().message.find("entities"), std::string::npos) << value.error().message;
}

TEST(PropertyList, ErrorsNameTheirLine) {
    const auto value = platform::readPropertyList(plist("<array>\n<true/>\n<integer>x</integer></array>"));
    ASSERT_FALSE(value.ok());
    EXPECT_NE(value.error().message.find("line 4"), std::string::npos) << value.error().message;
}

TEST(PropertyList, StopsBeforeAKey) {
    const auto head = platform::readPropertyListBefore(
        plist(
            "<dict><key>a</key><dict><key>samples</key><integer>1</integer></dict><key>samples</key><broken"),
        "samples");
    ASSERT_TRUE(head.ok()) << head.error().message;
    ASSERT_EQ(head->size(), 1u);
    EXPECT_EQ((*(*head).at("a")["samples"]).integer(), 1);
    const auto whole = platform::readPropertyListBefore(plist("<dict><key>a</key><true/></dict>"), "samples");
    ASSERT_TRUE(whole.ok());
    EXPECT_EQ(whole->size(), 1u);
    EXPECT_FALSE(platform::readPropertyListBefore(plist("<array/>"), "samples").ok());
}

}  // namespace
