pragma Singleton
import QtQuick
import Qelvar.Items

// The colours and measures of the system's light look.
QtObject {
    property color tint: "#007aff" // of what can be touched; the application sets its own
    readonly property color background: "white"
    readonly property color groupedBackground: "#efeff4"
    readonly property color bar: "#f8f8f8"
    readonly property color hairline: "#b2b2b2"
    readonly property color text: "black"
    readonly property color secondaryText: "#6d6d72"
    readonly property color inactive: "#8a8a8f"
    readonly property color emphasis: "#d9d9dd" // behind what is pressed
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
