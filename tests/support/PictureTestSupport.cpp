#include "PictureTestSupport.h"

#include <QCoreApplication>
#include <QDir>
#include <algorithm>
#include <cstdlib>

namespace test {

namespace {

int channelDifference(QRgb a, QRgb b) {
    return std::max({std::abs(qRed(a) - qRed(b)), std::abs(qGreen(a) - qGreen(b)),
                     std::abs(qBlue(a) - qBlue(b)), std::abs(qAlpha(a) - qAlpha(b))});
}

}  // namespace

testing::AssertionResult matchesPicture(const QImage& image, const std::string& name, int channelTolerance,
                                        double share, const std::vector<QRect>& regions, double regionShare) {
    const QString file = QStringLiteral(QELVAR_TEST_DATA "/%1.png").arg(QString::fromStdString(name));
    const QImage actual = image.convertToFormat(QImage::Format_ARGB32_Premultiplied);
    if (qEnvironmentVariableIntValue("QELVAR_UPDATE_GOLDEN") == 1)
        return actual.save(file) ? testing::AssertionSuccess()
                                 : testing::AssertionFailure() << "cannot write " << file.toStdString();

    const QImage expected = QImage(file).convertToFormat(QImage::Format_ARGB32_Premultiplied);
    const QString folder = QCoreApplication::applicationDirPath() + "/pictures";
    const auto keep = [&](const QImage& one, const char* kind) {
        QString flat = QString::fromStdString(name);
        flat.replace('/', '-');
        QDir().mkpath(folder);
        one.save(QStringLiteral("%1/%2-%3.png").arg(folder, flat, QLatin1String(kind)));
    };
    if (expected.size() != actual.size()) {
        keep(actual, "actual");
        return testing::AssertionFailure()
               << name << ": " << actual.width() << " x " << actual.height() << " pixels instead of "
               << expected.width() << " x " << expected.height() << "; see " << folder.toStdString();
    }
    QImage difference(actual.size(), QImage::Format_RGB32);
    int differing = 0;
    for (int y = 0; y < actual.height(); ++y) {
        for (int x = 0; x < actual.width(); ++x) {
            const int off = channelDifference(actual.pixel(x, y), expected.pixel(x, y));
            if (off > channelTolerance) ++differing;
            difference.setPixel(
                x, y, qRgb(off, off > channelTolerance ? 0 : off, off > channelTolerance ? 0 : off));
        }
    }
    const double differingShare = static_cast<double>(differing) / (actual.width() * actual.height());
    const auto differs = [&](const QRect& region) {
        int inRegion = 0;
        for (int y = region.top(); y <= region.bottom(); ++y)
            for (int x = region.left(); x <= region.right(); ++x)
                inRegion += difference.valid(x, y) && qRed(difference.pixel(x, y)) > channelTolerance;
        return inRegion > regionShare * region.width() * region.height();
    };
    const auto region = std::find_if(regions.begin(), regions.end(), differs);
    if (differingShare <= share && region == regions.end()) return testing::AssertionSuccess();
    keep(actual, "actual");
    keep(difference, "difference");
    auto failure = testing::AssertionFailure()
                   << name << ": " << differing << " pixels differ (" << 100 * differingShare << " %)";
    if (region != regions.end())
        failure << ", too many around " << region->center().x() << ", " << region->center().y();
    return failure << "; see " << folder.toStdString();
}

}  // namespace test
