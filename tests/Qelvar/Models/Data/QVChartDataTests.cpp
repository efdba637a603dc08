#include <gtest/gtest.h>

#include <cmath>
#include <limits>

#include "Qelvar/Models/Data/QVChartDataGroup.h"
#include "TestSupport.h"

namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();

VSDate day(int number) {
    return VSDate::fromSeconds(number * 86'400);
}
QVChartPointPtr point(int when, std::optional<double> value) {
    return QVChartPointNumeric::chartPoint(day(when), value);
}
QVChartPointPtr range(int when, double low, double high) {
    return QVChartPointDictionary::chartPoint(day(when), {{"min", low}, {"max", high}});
}

struct Annotation : QVChartPointAnnotation {};

// Sets of points in memory, as a renderer gives them.
struct GroupSource : QVChartDataGroupDataSource {
    size_t numberOfDataSetsInGroup(const QVChartDataGroup&) override { return sets.size(); }
    size_t numberOfPointsInSetAtIndex(const QVChartDataGroup&, size_t set) override {
        return sets.at(set).size();
    }
    QVChartPointPtr pointForSetAtIndex(const QVChartDataGroup&, size_t set, size_t index) override {
        return sets.at(set).at(index);
    }
    QVChartPointAnnotationPtr annotationForPointInSetAtIndex(const QVChartDataGroup&, size_t set,
                                                             size_t index) override {
        return set == annotatedSet && index == 0 ? annotation : nullptr;
    }
    std::vector<std::vector<QVChartPointPtr>> sets;
    size_t annotatedSet = SIZE_MAX;
    QVChartPointAnnotationPtr annotation = std::make_shared<Annotation>();
};

TEST(QVChartPoint, AnswersForItsNumbers) {
    using Style = QVChartPointDictionary::AverageStyle;
    EXPECT_EQ(point(1, 5.5)->yValueForKey("any"), 5.5);
    EXPECT_EQ(point(1, 5.5)->allYValues(), std::vector{5.5});
    EXPECT_EQ(point(1, 5.5)->averageYValue(), 5.5);
    EXPECT_EQ(point(1, 5.5)->yValueFloatRepresentation(), 5.5);
    const auto values = QVChartPointDictionary::chartPoint(day(1), {{"a", 3}, {"b", 7}});
    EXPECT_EQ(values->minYValue(), 3);
    EXPECT_EQ(values->maxYValue(), 7);
    EXPECT_EQ(values->averageYValue(), 5);
    EXPECT_EQ(values->yValueForKey("b"), 7);
    EXPECT_EQ(values->yValueForKey("c"), std::nullopt);
    EXPECT_EQ(values->yValueFloatRepresentation(), 3);
    values->setAverageStyle(Style::Minimum);
    EXPECT_EQ(values->averageYValue(), 3);
    for (const auto style : {Style::Maximum, Style{-1}, Style{9}}) {
        values->setAverageStyle(style);
        EXPECT_EQ(values->averageYValue(), 7);
    }
    EXPECT_EQ(range(1, -infinity, infinity)->averageYValue(), std::nullopt);
    const QVChartPointPtr without[] = {point(1, std::nullopt),
                                       QVChartPointDictionary::chartPoint(day(1), {})};
    for (const auto& none : without) {
        EXPECT_TRUE(none->allYValues().empty());
        EXPECT_EQ(none->minYValue(), std::nullopt);
        EXPECT_EQ(none->maxYValue(), std::nullopt);
        EXPECT_EQ(none->averageYValue(), std::nullopt);
        EXPECT_EQ(none->yValueFloatRepresentation(), 0);
    }
}

TEST(QVChartPoint, EqualityIsKindDateAndNumbers) {
    const auto a = point(1, 5.0), b = point(1, 5.0);
    b->setAnnotation(std::make_shared<Annotation>());
    EXPECT_EQ(*a, *b);
    EXPECT_EQ(a->hash(), b->hash());
    EXPECT_EQ(point(1, 0.0)->hash(), point(1, -0.0)->hash());
    EXPECT_FALSE(*a == *point(2, 5.0));
    EXPECT_FALSE(*a == *point(1, 5.1));
    EXPECT_FALSE(*a == *point(1, std::nullopt));
    EXPECT_EQ(*point(1, std::nullopt), *point(1, std::nullopt));

    const auto c = QVChartPointDictionary::chartPoint(day(1), {{"min", 5}}),
               d = QVChartPointDictionary::chartPoint(day(1), {{"min", 5}});
    EXPECT_EQ(*c, *d);
    EXPECT_EQ(c->hash(), d->hash());
    EXPECT_FALSE(*a == *c);
    d->setAverageStyle(QVChartPointDictionary::AverageStyle::Maximum);
    EXPECT_FALSE(*c == *d);
}

class QVChartDataGroupTest : public testing::Test {
 protected:
    QVChartDataGroupTest() { group_->setDataSource(source_); }
    std::shared_ptr<GroupSource> source_ = std::make_shared<GroupSource>();
    std::shared_ptr<QVChartDataGroup> group_ = QVChartDataGroup::create();
};

TEST_F(QVChartDataGroupTest, RangesAndTotalsOfSetsAndGroup) {
    source_->sets = {
        {point(3, 4.0), point(1, 9.0), point(2, std::nullopt)}, {range(5, 2, 12), range(4, 3, 5)}, {}};
    group_->reloadData();
    ASSERT_EQ(group_->numberOfDataSets(), 3u);
    const auto& first = *group_->dataSetAtIndex(0);
    EXPECT_EQ(first.minYValue(), 4);
    EXPECT_EQ(first.maxYValue(), 9);
    EXPECT_EQ(first.totalYValue(), 13);
    EXPECT_DOUBLE_EQ(first.averageYValue().value(), 13.0 / 3);  // by all its points
    EXPECT_EQ(first.minXValue(), day(1));
    EXPECT_EQ(first.maxXValue(), day(3));
    EXPECT_EQ(first.xValueForPointAtIndex(0), day(3));  // in the source's order
    EXPECT_EQ(group_->dataSetAtIndex(1)->yValueForPointAtIndex(0, "max"), 12);

    EXPECT_EQ(group_->minYValue(), 2);
    EXPECT_EQ(group_->maxYValue(), 12);
    EXPECT_DOUBLE_EQ(group_->averageYValue().value(), (4.0 + 9 + 7 + 4) / 4);  // by the points that have one
    EXPECT_EQ(group_->minXValue(), day(1));
    EXPECT_EQ(group_->maxXValue(), day(5));
    EXPECT_FALSE(group_->isEmpty());
    EXPECT_EQ(group_->dataSetAtIndex(3), nullptr);
}

TEST_F(QVChartDataGroupTest, EmptySetsHaveNoRange) {
    EXPECT_TRUE(group_->isEmpty());
    source_->sets = {{}, {}};
    group_->reloadData();
    EXPECT_TRUE(group_->isEmpty());
    EXPECT_EQ(group_->minYValue(), std::nullopt);
    EXPECT_EQ(group_->maxYValue(), std::nullopt);
    EXPECT_EQ(group_->averageYValue(), std::nullopt);
    EXPECT_EQ(group_->minXValue(), std::nullopt);
    EXPECT_EQ(group_->dataSetAtIndex(0)->totalYValue(), 0);
    EXPECT_TRUE(std::isnan(group_->dataSetAtIndex(0)->averageYValue().value()));
    source_->sets = {{point(1, infinity), point(2, -infinity)}};
    group_->reloadData();
    EXPECT_EQ(group_->dataSetAtIndex(0)->totalYValue(), std::nullopt);
    EXPECT_EQ(group_->dataSetAtIndex(0)->averageYValue(), std::nullopt);
    EXPECT_EQ(group_->averageYValue(), std::nullopt);
    source_->sets = {{point(1, std::nullopt)}};
    group_->reloadData();
    EXPECT_FALSE(group_->isEmpty());
    EXPECT_EQ(group_->minYValue(), std::nullopt);
}

TEST_F(QVChartDataGroupTest, ReloadKeepsSetsAndTheirTags) {
    source_->sets = {{point(1, 1.0)}, {point(1, 2.0)}};
    group_->reloadData();
    const auto first = group_->dataSetAtIndex(0);
    EXPECT_EQ(group_->dataSetAtIndex(1)->tag(), 1u);
    EXPECT_EQ(first->dataSource(), group_);
    source_->sets = {{point(1, 7.0), point(2, 8.0)}};
    group_->reloadData();
    EXPECT_EQ(group_->numberOfDataSets(), 1u);
    EXPECT_EQ(group_->dataSetAtIndex(0), first);
    EXPECT_EQ(first->numDataPoints(), 2u);
    EXPECT_EQ(group_->maxYValue(), 8);

    // One set or one point alone: the cached range stays.
    source_->sets[0] = {point(1, 7.0), point(2, 20.0), point(3, 30.0)};
    group_->reloadDataPointInSetAtIndex(0, 1);
    EXPECT_EQ(first->numDataPoints(), 2u);
    EXPECT_EQ(first->yValueForPointAtIndex(1, ""), 20);
    group_->reloadDataPointInSetAtIndex(0, 2);
    group_->reloadDataPointInSetAtIndex(1, 0);
    EXPECT_EQ(first->numDataPoints(), 2u);
    group_->reloadDataInSetAtIndex(0);
    EXPECT_EQ(first->numDataPoints(), 3u);
    EXPECT_EQ(group_->maxYValue(), 8);

    group_->reloadDataInSetAtIndex(1);  // there is none

    source_.reset();
    group_->reloadData();
    EXPECT_EQ(group_->numberOfDataSets(), 0u);
    EXPECT_EQ(group_->maxYValue(), std::nullopt);
}

TEST_F(QVChartDataGroupTest, CopyKeepsItsPointsThroughAReload) {
    source_->sets = {{point(1, 1.0)}};
    group_->reloadData();
    const auto copy = group_->copy();
    source_->sets = {{point(2, 5.0), point(3, 6.0)}};
    group_->reloadData();
    ASSERT_EQ(copy->numberOfDataSets(), 1u);
    EXPECT_EQ(copy->dataSetAtIndex(0)->numDataPoints(), 1u);
    EXPECT_EQ(copy->dataSetAtIndex(0)->maxYValue(), 1);
    EXPECT_EQ(copy->dataSetAtIndex(0)->dataSource(), nullptr);
    EXPECT_EQ(copy->dataSource(), nullptr);
    EXPECT_EQ(copy->maxYValue(), std::nullopt);
}

TEST_F(QVChartDataGroupTest, AnnotationsComeWithTheReload) {
    source_->sets = {{point(1, 1.0)}, {point(1, 2.0), point(2, 3.0)}};
    source_->sets[0][0]->setAnnotation(std::make_shared<Annotation>());
    source_->annotatedSet = 1;
    group_->reloadData();
    EXPECT_EQ(group_->dataSetAtIndex(0)->annotationForPointAtIndex(0), nullptr);
    EXPECT_EQ(group_->dataSetAtIndex(1)->annotationForPointAtIndex(0), source_->annotation);
    EXPECT_EQ(group_->dataSetAtIndex(1)->annotationForPointAtIndex(1), nullptr);
}

}  // namespace
