#include "Platform/StyledText.h"

#include <QFontDatabase>
#include <QFontMetricsF>
#include <QTextBoundaryFinder>
#include <QTextLayout>
#include <algorithm>
#include <cmath>
#include <functional>
#include <variant>

#include "Platform/Localization.h"
#include "Platform/TextScale.h"

namespace platform {

namespace {

constexpr double defaultFontSize = 12;

// Spelled out, so that the glyphs of other scripts do not depend on what the host's font settings prefer.
const QStringList& systemFontFamilies() {
    static const QStringList families = [] {
        QStringList result;
        if (!QFontDatabase::hasFamily(QStringLiteral("Noto Sans"))) return result;
        for (const auto* family : {"Noto Sans", "Noto Sans Arabic", "Noto Sans Devanagari"})
            result << QString::fromLatin1(family);
        return result;
    }();
    return families;
}

QFont makeSystemFont(double size, QFont::Weight weight) {
    QFont font;
    if (!systemFontFamilies().isEmpty()) font.setFamilies(systemFontFamilies());
    const double points = (size > 0 ? size : defaultFontSize) * textScale();
    font.setPixelSize(std::max(1, static_cast<int>(std::lround(points))));
    font.setWeight(weight);
    // Widths must be the same on every screen and in every image, whatever its scale.
    font.setHintingPreference(QFont::PreferNoHinting);
    return font;
}

// Where runs lie side by side: text that stands together is one layout (so that the direction of its
// characters and the joining of letters go across runs), an image or a space stands alone.
struct Piece {
    std::vector<const StyledRun*> text;  // empty: `single` is an image or a space
    const StyledRun* single = nullptr;
};

std::vector<Piece> pieces(const std::vector<StyledRun>& runs) {
    std::vector<Piece> result;
    for (const auto& run : runs) {
        if (!run.image.isNull() || run.spacing > 0) {
            result.push_back({{}, &run});
        } else if (!run.text.isEmpty()) {
            if (result.empty() || result.back().single) result.emplace_back();
            result.back().text.push_back(&run);
        }
    }
    return result;
}

QSizeF imageSize(const QImage& image) {
    return QSizeF(image.size()) / image.devicePixelRatio();
}

// One line of one or more text runs, in unscaled points.
class TextLine {
 public:
    TextLine(const std::vector<const StyledRun*>& runs, const QFont& defaultFont, bool rightToLeft)
        : rightToLeft_(rightToLeft) {
        for (const auto* run : runs) append(run->text, run->font.value_or(defaultFont), run->color);
        layOut();
    }

    double width() const { return width_; }

    void draw(QPainter& painter, double ascent) const { layout_->draw(&painter, QPointF(0, -ascent)); }
    double ascent() const { return layout_->lineAt(0).ascent(); }

    // The longest beginning of the line with an ellipsis behind it that is not wider; the ellipsis alone when
    // none is.
    TextLine cut(double maxWidth) const {
        std::vector<qsizetype> ends{0};
        QTextBoundaryFinder graphemes(QTextBoundaryFinder::Grapheme, text_);
        while (graphemes.toNextBoundary() > 0) ends.push_back(graphemes.position());
        const auto fits = [&](qsizetype end) { return beginning(end).width() <= maxWidth; };
        // Widths grow with the length, so the first end that is too long splits them.
        auto split = std::partition_point(ends.begin() + 1, ends.end(), fits);
        return beginning(*(split - 1));
    }

 private:
    explicit TextLine(bool rightToLeft) : rightToLeft_(rightToLeft) {}

    TextLine beginning(qsizetype end) const {
        // No blank before the ellipsis.
        while (end > 0 && text_[end - 1].isSpace()) --end;
        TextLine result(rightToLeft_);
        QFont lastFont = formats_.front().format.font();
        std::optional<QColor> lastColor = color(formats_.front());
        for (const auto& range : formats_) {
            if (range.start >= end) break;
            lastFont = range.format.font();
            lastColor = color(range);
            result.append(text_.mid(range.start, std::min<qsizetype>(range.length, end - range.start)),
                          lastFont, lastColor);
        }
        result.append(QStringLiteral("\u2026"), lastFont, lastColor);
        result.layOut();
        return result;
    }

    static std::optional<QColor> color(const QTextLayout::FormatRange& range) {
        if (!range.format.hasProperty(QTextFormat::ForegroundBrush)) return std::nullopt;
        return range.format.foreground().color();
    }

    void append(const QString& text, const QFont& font, const std::optional<QColor>& color) {
        QTextLayout::FormatRange range;
        range.start = static_cast<int>(text_.size());
        range.length = static_cast<int>(text.size());
        range.format.setFont(font);
        if (color) range.format.setForeground(*color);
        formats_.push_back(range);
        text_ += text;
    }

    void layOut() {
        layout_ = std::make_unique<QTextLayout>(text_, formats_.front().format.font());
        QTextOption option;
        option.setTextDirection(rightToLeft_ ? Qt::RightToLeft : Qt::LeftToRight);
        option.setWrapMode(QTextOption::NoWrap);
        option.setUseDesignMetrics(true);
        // Aligned to the left end whatever the direction: the line is as wide as its text.
        option.setAlignment(Qt::AlignLeft | Qt::AlignAbsolute);
        layout_->setTextOption(option);
        layout_->setFormats(QList<QTextLayout::FormatRange>(formats_.begin(), formats_.end()));
        layout_->beginLayout();
        QTextLine line = layout_->createLine();
        line.setLineWidth(1e6);
        // Blanks at the end count as well: they stand between this text and what follows it.
        width_ = line.horizontalAdvance();
        line.setLineWidth(std::ceil(width_) + 1);
        line.setPosition(QPointF(0, 0));
        layout_->endLayout();
    }

    bool rightToLeft_;
    QString text_;
    std::vector<QTextLayout::FormatRange> formats_;
    std::unique_ptr<QTextLayout> layout_;
    double width_ = 0;
};

// A piece with its width in points, scaled.
struct Placed {
    std::optional<TextLine> line;
    const StyledRun* single = nullptr;
    double width = 0;
};

std::vector<Placed> placed(const std::vector<StyledRun>& runs, const QFont& defaultFont, double scale,
                           bool rightToLeft) {
    std::vector<Placed> result;
    for (const auto& piece : pieces(runs)) {
        if (piece.single) {
            const double width =
                piece.single->image.isNull() ? piece.single->spacing : imageSize(piece.single->image).width();
            result.push_back({std::nullopt, piece.single, width * scale});
        } else {
            TextLine line(piece.text, defaultFont, rightToLeft);
            const double width = line.width() * scale;
            result.push_back({std::move(line), nullptr, width});
        }
    }
    return result;
}

double totalWidth(const std::vector<Placed>& line) {
    double width = 0;
    for (const auto& piece : line) width += piece.width;
    return width;
}

// Takes pieces away from the end until those left fit beside an ellipsis, which ends the last text.
void cutToWidth(std::vector<Placed>& line, double maxWidth, double scale) {
    double before = totalWidth(line);
    while (!line.empty()) {
        Placed& last = line.back();
        before -= last.width;
        if (last.line) {
            TextLine shorter = last.line->cut((maxWidth - before) / scale);
            const double width = shorter.width() * scale;
            const bool isFirstText = std::none_of(line.begin(), line.end() - 1,
                                                  [](const Placed& piece) { return piece.line.has_value(); });
            if (before + width <= maxWidth || isFirstText) {
                last.line = std::move(shorter);
                last.width = width;
                return;
            }
        }
        line.pop_back();
    }
}

struct VerticalExtent {
    double ascent = 0, descent = 0;
};

VerticalExtent extent(const std::vector<StyledRun>& runs, const QFont& defaultFont, double scale) {
    VerticalExtent result;
    bool any = false;
    for (const auto& run : runs) {
        if (!run.image.isNull()) {
            const double height = imageSize(run.image).height();
            result.ascent = std::max(result.ascent, (height + run.baselineOffset) * scale);
            result.descent = std::max(result.descent, -run.baselineOffset * scale);
            any = true;
        } else if (run.spacing <= 0) {
            const QFontMetricsF metrics(run.font.value_or(defaultFont));
            result.ascent = std::max(result.ascent, metrics.ascent() * scale);
            result.descent = std::max(result.descent, metrics.descent() * scale);
            any = true;
        }
    }
    if (!any) {
        const QFontMetricsF metrics(defaultFont);
        result = {metrics.ascent() * scale, metrics.descent() * scale};
    }
    return result;
}

}  // namespace

QFont systemFont(double size) {
    return makeSystemFont(size, QFont::Normal);
}
QFont boldSystemFont(double size) {
    return makeSystemFont(size, QFont::Bold);
}

StyledText::StyledText(const QString& text, std::optional<QFont> font, std::optional<QColor> color) {
    if (text.isEmpty()) return;
    StyledRun run;
    run.text = text;
    run.font = std::move(font);
    run.color = color;
    runs_.push_back(std::move(run));
}

StyledText StyledText::spacer(double width) {
    StyledText result;
    if (width > 0) {
        StyledRun run;
        run.spacing = width * textScale();
        result.runs_.push_back(std::move(run));
    }
    return result;
}

StyledText StyledText::withImage(const QImage& image, double baselineOffset) {
    StyledText result;
    if (!image.isNull()) {
        StyledRun run;
        run.image = image;
        run.baselineOffset = baselineOffset;
        result.runs_.push_back(std::move(run));
    }
    return result;
}

QString StyledText::plainText() const {
    QString result;
    for (const auto& run : runs_) result += run.text;
    return result;
}

QString StyledText::spokenText() const {
    QString result;
    for (const auto& run : runs_) result += run.text.isEmpty() ? QStringLiteral(" ") : run.text;
    return result.simplified();
}

StyledText& StyledText::operator+=(const StyledText& other) {
    const std::vector<StyledRun> added = other.runs_;  // may be this one
    runs_.insert(runs_.end(), added.begin(), added.end());
    return *this;
}

QSizeF StyledText::size(const QFont& defaultFont, double scale) const {
    const VerticalExtent vertical = extent(runs_, defaultFont, scale);
    return {totalWidth(placed(runs_, defaultFont, scale, isRightToLeft())),
            vertical.ascent + vertical.descent};
}

double StyledText::ascent(const QFont& defaultFont, double scale) const {
    return extent(runs_, defaultFont, scale).ascent;
}

StyledText::Ink StyledText::ink(const QFont& defaultFont) const {
    Ink result;
    for (const auto& run : runs_) {
        QRectF drawn;
        if (!run.image.isNull())
            drawn =
                QRectF(QPointF(0, -imageSize(run.image).height() - run.baselineOffset), imageSize(run.image));
        else if (run.spacing <= 0)
            drawn = QFontMetricsF(run.font.value_or(defaultFont)).tightBoundingRect(run.text);
        result.above = std::max(result.above, -drawn.top());
        result.below = std::max(result.below, drawn.bottom());
    }
    return result;
}

void StyledText::draw(QPainter& painter, QPointF baselineLeft, const QFont& defaultFont,
                      const QColor& defaultColor, double maxWidth, double scale) const {
    const bool rightToLeft = isRightToLeft();
    auto line = placed(runs_, defaultFont, scale, rightToLeft);
    // Widths are sums of fractions: what was measured must fit into its own measure.
    constexpr double tolerance = 0.01;
    if (totalWidth(line) > maxWidth + tolerance) cutToWidth(line, maxWidth, scale);
    if (rightToLeft) std::reverse(line.begin(), line.end());

    painter.save();
    painter.setPen(defaultColor);
    double x = baselineLeft.x();
    for (const auto& piece : line) {
        if (piece.line) {
            painter.save();
            painter.translate(x, baselineLeft.y());
            if (scale != 1.0) painter.scale(scale, scale);
            piece.line->draw(painter, piece.line->ascent());
            painter.restore();
        } else if (!piece.single->image.isNull()) {
            const QSizeF size = imageSize(piece.single->image) * scale;
            const double bottom = baselineLeft.y() - piece.single->baselineOffset * scale;
            painter.drawImage(QRectF(QPointF(x, bottom - size.height()), size), piece.single->image);
        }
        x += piece.width;
    }
    painter.restore();
}

StyledText joinForLocale(const std::vector<StyledText>& pieces) {
    // Runs are drawn in the reading order of the user's language already.
    StyledText result;
    for (const auto& piece : pieces) result += piece;
    return result;
}

StyledText joinWithFormat(const char* key, const std::vector<StyledText>& pieces) {
    const QString format = localized(key);
    StyledText result;
    QString literal;
    for (qsizetype i = 0; i < format.size(); ++i) {
        const int digit = format[i] == u'%' && i + 1 < format.size() ? format[i + 1].digitValue() : -1;
        if (digit >= 1 && digit <= static_cast<int>(pieces.size())) {
            result += StyledText(literal);
            literal.clear();
            result += pieces[static_cast<size_t>(digit) - 1];
            ++i;
        } else {
            literal += format[i];
        }
    }
    return result + StyledText(literal);
}

StyledText prefixedWithImage(const StyledText& text, const QImage& image, double baselineAdjustment,
                             double spacing) {
    return StyledText::withImage(image, baselineAdjustment) + StyledText::spacer(spacing) + text;
}

}  // namespace platform
