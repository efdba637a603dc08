import QtQuick

// The pill look of the time scope control: a button for each scope, the selected one on a pill of the key colour.
QVTimeScopeControlBase {
    id: root
    readonly property int textSize: SystemStyle.captionSize * 12 / 13 // 12 points

    Row {
        id: buttons
        readonly property real widest: (root.width - 2 * 8 - (repeater.count - 1) * spacing) / repeater.count
        anchors.horizontalCenter: parent.horizontalCenter
        height: parent.height
        spacing: 4
        Repeater {
            id: repeater
            model: root.control ? root.control.segments : []
            MouseArea {
                id: button
                required property string modelData
                required property int index
                readonly property bool checked: root.control.selectedIndex === index
                width: Math.min(buttons.widest, Math.ceil(title.advanceWidth) + 2 * pill.radius)
                height: buttons.height
                onClicked: root.control.pick(index)
                Accessible.role: Accessible.RadioButton
                Accessible.name: modelData
                Accessible.checkable: true
                Accessible.checked: checked
                Accessible.onPressAction: root.control.pick(index)
                Accessible.onToggleAction: root.control.pick(index)
                TextMetrics { id: title; font: label.font; text: button.modelData }
                Rectangle {
                    id: pill
                    anchors.verticalCenter: parent.verticalCenter
                    width: parent.width
                    height: Math.max(24, label.implicitHeight + 8)
                    radius: 12
                    color: button.checked ? SystemStyle.tint : button.pressed ? SystemStyle.emphasis : "transparent"
                }
                Text {
                    id: label
                    anchors.fill: parent
                    text: button.modelData
                    color: button.checked ? "white" : SystemStyle.secondaryText
                    font.pixelSize: root.textSize
                    fontSizeMode: Text.HorizontalFit
                    minimumPixelSize: 10
                    horizontalAlignment: Text.AlignHCenter
                    verticalAlignment: Text.AlignVCenter
                    elide: Text.ElideRight
                }
            }
        }
    }
    FocusRing {
        anchors { fill: buttons; leftMargin: -5; rightMargin: -5; topMargin: 4; bottomMargin: 4 }
        shown: root.showsFocus
    }
}
