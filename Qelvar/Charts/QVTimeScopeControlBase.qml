import QtQuick

// What the looks of the time scope control share: one stop of the Tab key, where the arrow keys move the selection.
FocusScope {
    id: root
    property var control: null
    readonly property bool isMirrored: LayoutMirroring.enabled
    // A pointer's press gives the focus too, which needs no ring.
    readonly property bool showsFocus: activeFocus && keyboard
    property bool keyboard: false
    implicitHeight: 44
    activeFocusOnTab: true
    Accessible.role: Accessible.PageTabList
    Accessible.name: control ? control.accessibleName : ""

    function move(step) {
        const index = control.selectedIndex + step
        if (index >= 0 && index < control.segments.length) control.pick(index)
    }
    Keys.onLeftPressed: move(isMirrored ? 1 : -1)
    Keys.onRightPressed: move(isMirrored ? -1 : 1)
    Keys.onReleased: keyboard = true
    onActiveFocusChanged: if (!activeFocus) keyboard = false
}
