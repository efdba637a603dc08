import QtQuick

// The bar look of the time scope control: one segment for each scope.
QVTimeScopeControlBase {
    id: root
    implicitHeight: Math.max(44, frame.height + 16)

    FontMetrics { id: metrics; font.pixelSize: SystemStyle.captionSize }
    Rectangle {
        id: frame
        anchors.centerIn: parent
        anchors.verticalCenterOffset: -1
        width: parent.width - 2 * 8
        height: Math.max(28, metrics.height + 8)
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
            MouseArea {
                id: segment
                required property string modelData
                required property int index
                readonly property bool checked: root.control.selectedIndex === index
                readonly property bool atLeft: root.isMirrored ? index === repeater.count - 1 : index === 0
                readonly property bool atRight: root.isMirrored ? index === 0 : index === repeater.count - 1
                width: segments.width / repeater.count
                height: segments.height
                onClicked: root.control.pick(index)
                Accessible.role: Accessible.RadioButton
                Accessible.name: modelData
                Accessible.checkable: true
                Accessible.checked: checked
                Accessible.onPressAction: root.control.pick(index)
                Accessible.onToggleAction: root.control.pick(index)
                Rectangle {
                    anchors.fill: parent
                    color: segment.checked ? SystemStyle.tint : segment.pressed ? Qt.alpha(SystemStyle.tint, 0.15) : "transparent"
                    radius: frame.radius
                    Rectangle { // inner sides are straight
                        visible: segment.checked
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
                Text {
                    anchors.fill: parent
                    text: segment.modelData
                    color: segment.checked ? "white" : SystemStyle.tint
                    font.pixelSize: SystemStyle.captionSize
                    fontSizeMode: Text.HorizontalFit
                    minimumPixelSize: 10
                    horizontalAlignment: Text.AlignHCenter
                    verticalAlignment: Text.AlignVCenter
                    elide: Text.ElideRight
                }
            }
        }
    }
    FocusRing { anchors.fill: frame; shown: root.showsFocus; gap: 3 }
}
