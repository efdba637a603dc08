pragma Singleton
import QtQuick

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
    readonly property int navigationBarHeight: 44
    readonly property int tabBarHeight: 49
    readonly property int touchHeight: 44
    readonly property int bodySize: 17
    readonly property int captionSize: 13
}
