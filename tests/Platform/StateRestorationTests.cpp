#include "Platform/StateRestoration.h"

#include <gtest/gtest.h>

#include <fstream>

#include "Platform/NavigationStack.h"
#include "QtTestSupport.h"
#include "TestSupport.h"

namespace {

using platform::NavigationStack;
using platform::RestorableState;
using platform::StateRestoration;

/// Goes by its title; keeps a number and the object that it was built on.
class Page : public platform::Screen {
 public:
    Page(const QString& title, std::shared_ptr<int> shared, int64_t value = 0)
        : number(value), shared_(std::move(shared)) {
        setTitle(title);
    }
    QUrl view() const override { return {}; }
    QString restorationIdentifier() const override { return title() == "nameless" ? QString() : title(); }
    void encodeRestorableState(RestorableState& state) const override {
        state.set("number", number);
        state.setObject("shared", shared_.get());
    }
    void decodeRestorableState(const RestorableState& state) override {
        number = state.integer("number").value_or(number);
    }
    int64_t number;

 private:
    const std::shared_ptr<int> shared_;
};

class StateRestorationTest : public testing::Test {
 protected:
    std::unique_ptr<StateRestoration> restoration() {
        auto result = std::make_unique<StateRestoration>(file_);
        result->objects().add("shared object", shared_);
        for (const QString name : {"a", "b"})
            result->setScreenFactory(name, [name](const RestorableState& state) -> std::unique_ptr<Page> {
                const auto shared = state.object<int>("shared");
                return shared ? std::make_unique<Page>(name, shared) : nullptr;
            });
        return result;
    }
    static QString pages(const NavigationStack& stack) {
        QStringList result;
        for (int i = 0; i < stack.count(); ++i)
            result << QString("%1=%2").arg(stack.screenAt(i)->title()).arg(page(stack, i).number);
        return result.join(' ');
    }
    static Page& page(const NavigationStack& stack, int index) {
        return dynamic_cast<Page&>(*stack.screenAt(index));
    }
    /// What is there of the screens in a later session.
    QString later(const std::vector<std::pair<const char*, std::shared_ptr<int>>>& above) {
        NavigationStack before("stack", std::make_unique<Page>("root", nullptr, 1));
        for (const auto& [title, shared] : above)
            before.push(std::make_unique<Page>(title, shared, before.count() + 1), false);
        auto restored = restoration();
        const VSValue::Array saved = restored->encodeStack(before);
        NavigationStack after("stack", std::make_unique<Page>("root", nullptr));
        restored->decodeStack(after, saved);
        return pages(after);
    }

    test::TemporaryFolder folder_;
    const std::filesystem::path file_ = folder_.path() / "state.json";
    const std::shared_ptr<int> shared_ = std::make_shared<int>(0);
};

TEST_F(StateRestorationTest, StacksComeBackAsFarAsTheirScreensCanBeMade) {
    EXPECT_EQ(later({}), "root=1");
    EXPECT_EQ(later({{"a", shared_}, {"b", shared_}, {"a", shared_}}), "root=1 a=2 b=3 a=4");
    EXPECT_EQ(later({{"a", shared_}, {"nameless", shared_}, {"b", shared_}}), "root=1 a=2");
    EXPECT_EQ(later({{"a", shared_}, {"unknown", shared_}, {"b", shared_}}), "root=1 a=2");
    EXPECT_EQ(later({{"a", shared_}, {"b", std::make_shared<int>(0)}}), "root=1 a=2") << "not registered";

    NavigationStack other("stack", std::make_unique<Page>("another root", nullptr));
    NavigationStack root("stack", std::make_unique<Page>("root", nullptr, 1));
    restoration()->decodeStack(other, restoration()->encodeStack(root));
    EXPECT_EQ(pages(other), "another root=0");
}

TEST_F(StateRestorationTest, IsSavedWhenItStandsStillAndAtTheEnd) {
    auto session = restoration();
    int64_t offset = 0;
    int asked = 0;
    session->setState([&] { return ++asked, VSValue::Dictionary{{"offset", offset}}; });
    for (; offset < 1000; ++offset) session->stateDidChange();
    EXPECT_EQ(asked, 0) << "not at every step";
    ASSERT_TRUE(test::waitUntil([this] { return std::filesystem::exists(file_); }));
    EXPECT_EQ(asked, 1);
    EXPECT_EQ(restoration()->savedState()->at("offset").integer(), 1000) << "a killed process keeps it";
    EXPECT_EQ(std::filesystem::status(file_).permissions(), std::filesystem::perms(0600));
    offset = 7;
    session->finish();
    EXPECT_EQ(restoration()->savedState()->at("offset").integer(), 7);
}

TEST_F(StateRestorationTest, WhatCannotBeReadCountsAsNone) {
    auto session = restoration();
    EXPECT_FALSE(session->savedState());
    session->setState([] { return VSValue::Dictionary{{"x", 1}}; });
    session->finish();
    std::ifstream file(file_);
    const std::string good((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    const auto savedStateOf = [this](const std::string& text) {
        std::ofstream(file_) << text;
        return restoration()->savedState();
    };
    EXPECT_TRUE(savedStateOf(good));
    std::string newer = good;
    newer.replace(newer.find("\"Version\":1") + 10, 1, "2");
    std::vector<std::string> bad{"",    std::string(3, '\0'),       "[]", "{\"dict\":{}}",
                                 newer, std::string(5'000'000, '[')};
    for (size_t length = 1; length < good.size(); ++length) bad.push_back(good.substr(0, length));
    for (const std::string& text : bad) EXPECT_FALSE(savedStateOf(text)) << text.substr(0, 80);
}

}  // namespace
