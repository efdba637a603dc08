pragma Singleton
import QtQuick
import Qelvar.Items

// The colours and measures of the system's light look.
QtObject {
    property color keyColor: "#007aff" // the application sets its own
    // Texts have a contrast of 4.5 to 1 on each of the backgrounds; for those who want more, of 7 to 1, and lines of 3 to 1.
    readonly property bool highContrast: Appearance.highContrast
    readonly property color tint: highContrast ? Qt.darker(keyColor, 1.7) : keyColor // of what can be touched
    readonly property color background: "white"
    readonly property color groupedBackground: "#efeff4"
    readonly property color bar: "#f8f8f8"
    readonly property color hairline: highContrast ? "#6d6d72" : "#b2b2b2"
    readonly property color text: "black"
    readonly property color secondaryText: highContrast ? "#3a3a3c" : "#66666b"
    readonly property color inactive: highContrast ? "#48484a" : "#6a6a6f"
    readonly property color emphasis: "#d9d9dd" // behind what is pressed
    // What changes is there at once for those who want less motion.
    readonly property bool animated: !Appearance.reducedMotion
    property real pixel: 1 // of the screen, in points; the window sets it
    // Texts are as large as the person wants them, and what holds them grows as a line of text does.
    readonly property real textScale: TextScale.factor
    readonly property bool largeText: textScale > 1
    function scaled(points) { return Math.round(points * textScale) }
    function grown(height, growth) { return Math.round(height + (textScale - 1) * growth) }
    readonly property int navigationBarHeight: grown(44, 22)
    readonly property int tabBarHeight: grown(49, 28)
    readonly property int touchHeight: grown(44, 22)
    readonly property int bodySize: scaled(17)
    readonly property int captionSize: scaled(13)
}
