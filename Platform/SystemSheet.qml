import QtQuick
import QtQuick.Templates as T

// A modal sheet above the window's screens, as wide as a phone's at most. What it holds gives its implicit height.
T.Popup {
    id: sheet
    property string title: "" // what a screen reader calls it
    readonly property real room: parent ? parent.width : 0
    readonly property real headroom: parent ? parent.height : 0 // nothing before it is in a window
    parent: T.Overlay.overlay
    x: Math.round((room - width) / 2)
    y: Math.round((headroom - height) / 2)
    width: Math.max(0, Math.min(room - 32, 420))
    height: Math.max(0, Math.min(implicitHeight, headroom - 48))
    modal: true
    focus: true
    closePolicy: T.Popup.NoAutoClose
    // The keyboard returns to where it was.
    property Item before: null
    onAboutToShow: before = parent.Window.activeFocusItem
    onClosed: if (before) before.forceActiveFocus()
    T.Overlay.modal: Rectangle { color: "#66000000" }
    background: Rectangle { color: SystemStyle.background; radius: 12 }
    contentItem: FocusScope {
        focus: true
        // What is above the window does not inherit its direction.
        LayoutMirroring.enabled: Application.layoutDirection === Qt.RightToLeft
        LayoutMirroring.childrenInherit: true
        Accessible.role: Accessible.Dialog
        Accessible.name: sheet.title
    }
}
