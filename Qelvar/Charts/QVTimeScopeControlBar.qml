import QtQuick
import QtQuick.Templates as T

// The bar look of the time scope control: one segment for each scope. One stop of the Tab key; the arrow keys move the
// selection.
FocusScope {
    id: root
    property var control: null
    readonly property int count: repeater.count
    activeFocusOnTab: true
    Accessible.role: Accessible.PageTabList
    Accessible.name: control ? control.accessibleName : ""

    function move(step) {
        const index = control.selectedIndex + step
        if (index >= 0 && index < count) control.pick(index)
    }
    Keys.onLeftPressed: move(segments.LayoutMirroring.enabled ? 1 : -1)
    Keys.onRightPressed: move(segments.LayoutMirroring.enabled ? -1 : 1)

    Rectangle {
        id: frame
        anchors.centerIn: parent
        anchors.verticalCenterOffset: -1
        width: parent.width - 2 * 8
        height: 28
        radius: 4
        color: SystemStyle.bar
        border.width: 1
        border.color: SystemStyle.tint
    }
    Row {
        id: segments
        anchors.fill: frame
        Repeater {
            id: repeater
            model: root.control ? root.control.segments : []
            T.AbstractButton {
                id: segment
                required property string modelData
                required property int index
                readonly property bool isSelected: root.control.selectedIndex === index
                width: segments.width / repeater.count
                height: segments.height
                text: modelData
                focusPolicy: Qt.NoFocus
                onClicked: root.control.pick(index)
                Accessible.role: Accessible.RadioButton
                Accessible.name: text
                Accessible.checkable: true
                Accessible.checked: isSelected
                background: Rectangle {
                    color: segment.isSelected ? SystemStyle.tint : segment.down ? Qt.alpha(SystemStyle.tint, 0.15) : "transparent"
                    radius: frame.radius
                    Rectangle { // inner sides are straight
                        visible: segment.isSelected
                        color: parent.color
                        anchors.fill: parent
                        anchors.leftMargin: segment.atLeft ? 4 : 0
                        anchors.rightMargin: segment.atRight ? 4 : 0
                        LayoutMirroring.enabled: false
                    }
                    Rectangle {
                        visible: !segment.atRight
                        color: SystemStyle.tint
                        width: 1
                        height: parent.height
                        x: parent.width - 0.5
                    }
                }
                readonly property bool isMirrored: segments.LayoutMirroring.enabled
                readonly property bool atLeft: isMirrored ? index === repeater.count - 1 : index === 0
                readonly property bool atRight: isMirrored ? index === 0 : index === repeater.count - 1
                contentItem: Text {
                    text: segment.text
                    color: segment.isSelected ? "white" : SystemStyle.tint
                    font.pixelSize: 13
                    horizontalAlignment: Text.AlignHCenter
                    verticalAlignment: Text.AlignVCenter
                    elide: Text.ElideRight
                }
            }
        }
    }
    FocusRing { anchors.fill: frame; shown: root.activeFocus && root.Window.window && root.keyboard; gap: 3 }
    // A pointer's press gives the focus too, which needs no ring.
    property bool keyboard: false
    onActiveFocusChanged: if (!activeFocus) keyboard = false
    Keys.onReleased: keyboard = true
}
