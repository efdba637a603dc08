#include <gtest/gtest.h>

#include <QSignalSpy>

#include "Platform/Localization.h"
#include "Qelvar/Charts/QVTimeScopeControl.h"
#include "TestSupport.h"

namespace {

const std::vector<QVTimeScope> scopes{QVTimeScope::Day, QVTimeScope::Week, QVTimeScope::Month,
                                      QVTimeScope::Year};

TEST(TimeScopeControl, StyleOneIsThePillsLookAndAnyOtherTheBars) {
    for (const int style : {-1, 0, 1, 2, 7}) {
        const auto control = QVTimeScopeControl::controlWithStyle(style, scopes);
        const bool pill = control->look() == QVTimeScopeControl::Look::Pill;
        EXPECT_EQ(pill, style == 1) << style;
        EXPECT_TRUE(control->view().fileName().contains(pill ? "Pill" : "Bar"));
        control->setSelectedTimeScope(QVTimeScope::Month);
        EXPECT_EQ(control->selectedIndex(), 2);
        control->setSelectedTimeScope(QVTimeScope::Hour);
        EXPECT_EQ(control->selectedIndex(), 0) << "not offered";
    }
}

TEST(TimeScopeControl, WhatIsReadAloudFollowsSelectionAndLanguage) {
    test::FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", "en_US");
    QVTimeScopeControl control(scopes);
    // As a layout reads it: again whenever it is told of a change.
    QString name = control.accessibleName();
    QObject::connect(&control, &QVTimeScopeControl::accessibleNameChanged, &control,
                     [&] { name = control.accessibleName(); });
    EXPECT_EQ(name, "Time scope, Day");
    control.setSelectedTimeScope(QVTimeScope::Year);
    EXPECT_EQ(name, "Time scope, Year");
    environment->setLocale("hi_IN");
    control.updateTitles();
    EXPECT_EQ(name, QString::fromUtf8("समय अवधि, वर्ष"));
    EXPECT_EQ(control.segments().first(), QString::fromUtf8("दिन"));
}

}  // namespace
