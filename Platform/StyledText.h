#pragma once

#include <QColor>
#include <QFont>
#include <QImage>
#include <QPainter>
#include <QString>
#include <optional>
#include <vector>

namespace platform {

/// The system font at a size in points of the layout (device-independent pixels), times textScale().
/// A size of 0 means the platform's default size.
QFont systemFont(double size);
QFont boldSystemFont(double size);

/// One piece of styled text: characters, an inline image, or an empty space of a given width.
struct StyledRun {
    QString text;
    std::optional<QFont> font;    // none: the font of who draws it
    std::optional<QColor> color;  // none: the colour of who draws it
    QImage image;                 // with a device pixel ratio; not null: an image in place of text
    double baselineOffset = 0;    // the image is moved up by this many points from standing on the baseline
    double spacing = 0;           // > 0: an empty space of this width
    friend bool operator==(const StyledRun&, const StyledRun&) = default;
};

/// Text in runs: one immutable-by-habit value, drawn by one function. Runs follow each other in reading
/// order of the user's language (right to left where that is written so).
class StyledText {
 public:
    StyledText() = default;
    explicit StyledText(const QString& text, std::optional<QFont> font = {},
                        std::optional<QColor> color = {});
    /// A space of that width beside texts of the normal size; it grows with textScale(). Width 0: empty.
    static StyledText spacer(double width);
    /// The image is as large as the person wants texts already.
    static StyledText withImage(const QImage& image, double baselineOffset);

    const std::vector<StyledRun>& runs() const { return runs_; }
    bool isEmpty() const { return runs_.empty(); }
    /// The characters alone: images and spaces leave nothing.
    QString plainText() const;
    /// The characters as a screen reader says them: what is apart stays apart.
    QString spokenText() const;
    StyledText& operator+=(const StyledText& other);
    friend StyledText operator+(StyledText a, const StyledText& b) { return a += b; }
    friend bool operator==(const StyledText&, const StyledText&) = default;

    /// Width and height in points when drawn with these defaults on one line; `scale` multiplies all sizes,
    /// those of spaces and images too.
    QSizeF size(const QFont& defaultFont, double scale = 1.0) const;
    double ascent(const QFont& defaultFont, double scale = 1.0) const;
    /// How far what is drawn reaches above and beneath the baseline. A letter of another script than the
    /// font's may reach farther than the font says.
    struct Ink {
        double above = 0, below = 0;
    };
    Ink ink(const QFont& defaultFont) const;
    /// Draws one line with its left end (right end of a right-to-left text is then left + width) at x and its
    /// baseline at y; cut with an ellipsis when wider than maxWidth.
    void draw(QPainter& painter, QPointF baselineLeft, const QFont& defaultFont, const QColor& defaultColor,
              double maxWidth, double scale = 1.0) const;

 private:
    std::vector<StyledRun> runs_;
};

/// Puts the pieces together in the reading order of the user's language.
StyledText joinForLocale(const std::vector<StyledText>& pieces);
/// Fills each placeholder (%1, %2 ...) of the localised text of `key` with the piece of that number; the rest
/// of the text is unstyled. An empty piece leaves nothing at its place.
StyledText joinWithFormat(const char* key, const std::vector<StyledText>& pieces);
/// The image, then `spacing` points, then the text.
StyledText prefixedWithImage(const StyledText& text, const QImage& image, double baselineAdjustment,
                             double spacing);

}  // namespace platform
