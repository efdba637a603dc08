#include <gtest/gtest.h>

#include "Platform/StyledText.h"
#include "Qelvar/Charts/QVHourAxisDescriptor.h"
#include "Qelvar/Charts/QVMonthAxisDescriptor.h"
#include "Qelvar/Charts/QVYearAxisDescriptor.h"
#include "TestSupport.h"
#include "Vessa/Base/VSCalendar.h"

using test::date;
using test::FixedEnvironment;

namespace {

struct Labels {
    std::vector<std::string> texts, places;
};

/// Texts, and places as local time without the offset.
Labels labelsOf(QVAxisDescriptor& axis, VSDate min, VSDate max) {
    axis.setMinValue(min);
    axis.setMaxValue(max);
    Labels result;
    for (const QVAxisLabel& label : axis.axisLabels().value()) {
        result.texts.push_back(label.text.toStdString());
        result.places.push_back(VSISO8601FromDate(label.location, VSCalendar::current()).substr(0, 16));
    }
    return result;
}

using Strings = std::vector<std::string>;

}  // namespace

TEST(HourAxis, NamesStartMiddleAndEndOfTheDay) {
    const FixedEnvironment environment;
    QVHourAxisDescriptor axis;
    const Labels whole = labelsOf(axis, date("2020-03-31"), date("2020-04-01"));
    EXPECT_EQ(whole.places, (Strings{"2020-03-31T00:00", "2020-03-31T12:00", "2020-04-01T00:00"}));
    EXPECT_EQ(whole.texts.front(), whole.texts.back());
    EXPECT_NE(whole.texts[0], whole.texts[1]);

    // A second short of the day the middle would still be before noon: it moves on by an hour.
    axis.setMaxValue(date("2020-03-31T23:59:59"));
    EXPECT_EQ(axis.positionForLabelAtIndex(1), date("2020-03-31T12:59:59.5"));
    EXPECT_EQ(axis.textForLabelAtIndex(1).toStdString(), whole.texts[1]);
    EXPECT_EQ(axis.numLabels(), 3u);

    const Labels nothing = labelsOf(axis, date("2020-03-31"), date("2020-03-31"));
    EXPECT_EQ(nothing.places, Strings(3, "2020-03-31T00:00"));
}

TEST(HourAxis, FollowsTheLocalesClockAndDigits) {
    const auto texts = [](const char* locale) {
        const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", locale);
        QVHourAxisDescriptor axis;
        return labelsOf(axis, date("2020-03-31"), date("2020-04-01")).texts;
    };
    EXPECT_EQ(texts("de_DE"), (Strings{"0", "12", "0"}));
    const Strings english = texts("en_US");
    EXPECT_EQ(english[0].substr(0, 2), "12");
    EXPECT_NE(english[0].find("AM"), std::string::npos) << english[0];
    EXPECT_NE(english[1].find("PM"), std::string::npos) << english[1];
    EXPECT_NE(texts("ar_EG")[1].find("١٢"), std::string::npos) << texts("ar_EG")[1];
}

TEST(HourAxis, DaysOfOtherLengthsKeepTheirMiddle) {
    const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen");
    QVHourAxisDescriptor axis;
    // 23 hours: the middle is 12:30 summer time. 25 hours: 11:30 winter time, moved on to 12:30.
    EXPECT_EQ(labelsOf(axis, date("2020-03-29"), date("2020-03-30")).places[1], "2020-03-29T12:30");
    EXPECT_EQ(labelsOf(axis, date("2020-10-25"), date("2020-10-26")).places[1], "2020-10-25T12:30");
    EXPECT_EQ(labelsOf(axis, date("2020-03-28T12:00"), date("2020-03-29T12:00")).places[1],
              "2020-03-29T00:30");
    const FixedEnvironment nepal("2020-03-31T20:00", "Asia/Kathmandu");
    EXPECT_EQ(labelsOf(axis, date("2020-03-29"), date("2020-03-30")).places[1], "2020-03-29T12:00");
}

TEST(HourAxis, AllLabelsHaveOneStyle) {
    const FixedEnvironment environment;
    QVHourAxisDescriptor axis;
    axis.setHighlightedLabelColor(Qt::white);
    axis.setUnhighlightedLabelColor(Qt::gray);
    axis.setUnhighlightedLabelFilter(QPainter::CompositionMode_Plus);
    labelsOf(axis, date("2020-03-31"), date("2020-04-01"));
    for (const QVAxisLabel& label : *axis.axisLabels()) {
        EXPECT_EQ(label.labelColor, QColor(Qt::gray));
        EXPECT_EQ(label.compositingFilter, QPainter::CompositionMode_Plus);
        EXPECT_EQ(label.labelFont, platform::systemFont(10));
    }
    axis.setAlwaysHighlight(true);
    axis.invalidateCache();
    for (const QVAxisLabel& label : *axis.axisLabels()) {
        EXPECT_EQ(label.labelColor, QColor(Qt::white));
        EXPECT_FALSE(label.compositingFilter);
    }
}

TEST(MonthAxis, AWeekHasItsSevenDaysAtNoon) {
    for (const char* zone : {"Europe/Copenhagen", "America/New_York", "Asia/Kathmandu"}) {
        const FixedEnvironment environment("2020-03-31T20:00", zone);
        QVMonthAxisDescriptor axis;
        axis.setHighlightedLabelColor(Qt::white);
        axis.setUnhighlightedLabelColor(Qt::gray);
        // The clocks go forward in Copenhagen in this week.
        const Labels week = labelsOf(axis, date("2020-03-26"), date("2020-04-02"));
        EXPECT_EQ(week.places,
                  (Strings{"2020-03-26T12:00", "2020-03-27T12:00", "2020-03-28T12:00", "2020-03-29T12:00",
                           "2020-03-30T12:00", "2020-03-31T12:00", "2020-04-01T12:00"}))
            << zone;
        EXPECT_EQ(week.texts, (Strings{"Mar 26", "27", "28", "29", "30", "31", "Apr 1"})) << zone;
        const auto& labels = *axis.axisLabels();
        for (size_t i = 0; i < labels.size(); ++i)
            EXPECT_EQ(labels[i].labelColor, QColor(i + 1 == labels.size() ? Qt::white : Qt::gray));
    }
}

TEST(MonthAxis, AMonthHasALabelAWeekBackFromItsLastDay) {
    const FixedEnvironment environment("2020-03-31T20:00", "America/New_York");
    QVMonthAxisDescriptor axis;
    axis.setDayOffset(7);
    // From winter to summer time (8 March): still at noon.
    const Labels month = labelsOf(axis, date("2020-03-01"), date("2020-04-01"));
    EXPECT_EQ(month.places, (Strings{"2020-03-03T12:00", "2020-03-10T12:00", "2020-03-17T12:00",
                                     "2020-03-24T12:00", "2020-03-31T12:00"}));
    EXPECT_EQ(month.texts, (Strings{"Mar 3", "10", "17", "24", "31"}));
    const Labels across = labelsOf(axis, date("2020-02-20"), date("2020-03-19"));
    EXPECT_EQ(across.texts, (Strings{"Feb 26", "Mar 4", "11", "18"}));

    EXPECT_TRUE(labelsOf(axis, date("2020-03-01"), date("2020-03-01")).texts.empty())
        << "no labels, but a valid range";
}

TEST(MonthAxis, SpeaksTheUsersLanguage) {
    const auto texts = [](const char* locale) {
        const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", locale);
        QVMonthAxisDescriptor axis;
        return labelsOf(axis, date("2020-03-30"), date("2020-04-02")).texts;
    };
    EXPECT_EQ(texts("de_DE"), (Strings{"30. März", "31", "1. Apr."}));
    EXPECT_EQ(texts("hi_IN"), (Strings{"30 मार्च", "31", "1 अप्रैल"}));
    EXPECT_EQ(texts("ar_EG"), (Strings{"٣٠ مارس", "٣١", "١ أبريل"}));
}

TEST(YearAxis, EveryThirdMonthBackFromTheMiddleOfTheLast) {
    const FixedEnvironment environment;
    QVYearAxisDescriptor axis;
    axis.setHighlightedLabelColor(Qt::white);
    axis.setUnhighlightedLabelColor(Qt::gray);
    const Labels year = labelsOf(axis, date("2019-04-01"), date("2020-03-31T23:59:59"));
    // The middle of March is an hour off midnight by the clocks' change; the others keep day and time of it.
    EXPECT_EQ(year.places,
              (Strings{"2019-06-16T11:30", "2019-09-16T11:30", "2019-12-16T11:30", "2020-03-16T11:30"}));
    EXPECT_EQ(year.texts, (Strings{"Jun 2019", "Sep", "Dec", "Mar 2020"}));
    EXPECT_EQ(axis.axisLabels()->back().labelColor, QColor(Qt::white));
    EXPECT_EQ(axis.axisLabels()->front().labelColor, QColor(Qt::gray));

    EXPECT_EQ(labelsOf(axis, date("2020-03-01"), date("2020-03-01")).texts, (Strings{"Mar 2020"}));
    EXPECT_TRUE(labelsOf(axis, date("2020-03-31"), date("2020-03-31")).texts.empty())
        << "the middle lies before the range";
}

TEST(YearAxis, SpeaksTheUsersLanguage) {
    const auto first = [](const char* locale) {
        const FixedEnvironment environment("2020-03-31T20:00", "Europe/Copenhagen", locale);
        QVYearAxisDescriptor axis;
        return labelsOf(axis, date("2019-07-01"), date("2020-04-01")).texts.front();
    };
    EXPECT_EQ(first("de_DE"), "Juli 2019");
    EXPECT_EQ(first("hi_IN"), "जुल॰ 2019");
    EXPECT_EQ(first("ar_EG"), "يوليو ٢٠١٩");
}

TEST(AxisDescriptor, AnInvalidRangeHasNoLabels) {
    const FixedEnvironment environment;
    QVHourAxisDescriptor axis;
    EXPECT_FALSE(axis.axisLabels());
    EXPECT_EQ(axis.numLabels(), 0u);
    axis.setMinValue(date("2020-03-31"));
    EXPECT_FALSE(axis.axisLabels());
    axis.setMaxValue(date("2020-03-30"));
    EXPECT_FALSE(axis.axisLabels());
    axis.setMaxValue(date("2020-04-01"));
    EXPECT_TRUE(axis.axisLabels());
    axis.setMinValue(std::nullopt);
    EXPECT_FALSE(axis.axisLabels());
}

TEST(AxisDescriptor, LabelsAreKeptUntilTheRangeChangesOrTheyAreDropped) {
    FixedEnvironment environment;
    QVMonthAxisDescriptor axis;
    EXPECT_EQ(labelsOf(axis, date("2020-03-30"), date("2020-04-01")).texts, (Strings{"Mar 30", "31"}));
    environment->setLocale("de_DE");
    axis.setMinValue(date("2020-03-30"));
    EXPECT_EQ(axis.textForLabelAtIndex(0), "Mar 30") << "the same range: kept";
    axis.invalidateCache();
    EXPECT_EQ(axis.textForLabelAtIndex(0), "30. März");
    axis.setMinValue(date("2020-03-31"));
    EXPECT_EQ(axis.numLabels(), 1u);
}

TEST(AxisLabel, DescribesItself) {
    const FixedEnvironment environment;
    const QVAxisLabel label{"31", date("2020-03-31T12:00"), Qt::white, {}, {}};
    EXPECT_EQ(label.description(), "Text: 31, Location: 2020-03-31T12:00:00+02:00, Color: #ffffffff");
}
