import QtQuick
import QtQuick.Templates as T
import Qelvar.Items

FocusScope {
    id: root
    property var screen: null

    Rectangle { anchors.fill: parent; color: SystemStyle.groupedBackground }

    Flickable {
        id: rows
        anchors.fill: parent
        function show(row) {
            const top = row.mapToItem(contentItem, 0, 0).y
            contentY = Math.max(Math.min(contentY, top), top + row.height - height)
        }
        contentHeight: content.height + 48
        boundsBehavior: Flickable.StopAtBounds
        Column {
            id: content
            y: 24
            width: parent.width
            spacing: 20

            Column { // what can be done already
                width: parent.width
                visible: root.screen.actionTitles.length > 0
                Repeater {
                    model: root.screen.actionTitles
                    T.Button {
                        id: action
                        required property string modelData
                        required property int index
                        width: content.width
                        height: Math.max(SystemStyle.touchHeight, actionText.implicitHeight + 16)
                        readonly property var onState: root.screen.actionStates[index]
                        readonly property bool isSwitch: onState === true || onState === false
                        text: modelData
                        focus: index === 0
                        onClicked: root.screen.runAction(index)
                        onVisualFocusChanged: if (visualFocus) rows.show(action)
                        Accessible.name: text
                        Accessible.role: isSwitch ? Accessible.CheckBox : Accessible.Button
                        Accessible.checkable: isSwitch
                        Accessible.checked: onState === true
                        Keys.onReturnPressed: action.clicked()
                        Keys.onEnterPressed: action.clicked()
                        background: Rectangle {
                            color: action.down ? SystemStyle.emphasis : SystemStyle.background
                            Rectangle { width: parent.width; height: SystemStyle.pixel; color: SystemStyle.hairline }
                            Rectangle { width: parent.width; height: SystemStyle.pixel; color: SystemStyle.hairline; y: parent.height - height }
                        }
                        contentItem: Text {
                            id: actionText
                            wrapMode: Text.Wrap
                            leftPadding: action.isSwitch && action.mirrored ? 44 : 16
                            rightPadding: action.isSwitch && !action.mirrored ? 44 : 16
                            text: action.text
                            color: SystemStyle.tint
                            font.pixelSize: SystemStyle.bodySize
                            horizontalAlignment: Text.AlignLeft
                            verticalAlignment: Text.AlignVCenter
                        }
                        Icon {
                            anchors { right: parent.right; rightMargin: 16; verticalCenter: parent.verticalCenter }
                            visible: action.onState === true
                            width: 20
                            height: 20
                            name: "checkmark"
                            tint: SystemStyle.tint
                        }
                        FocusRing { anchors.margins: 2; shown: action.visualFocus }
                    }
                }
            }
            Icon {
                anchors.horizontalCenter: parent.horizontalCenter
                visible: name.length > 0
                width: 48
                height: 48
                name: root.screen.icon
                tint: root.screen.iconIsGlyph ? SystemStyle.inactive : "transparent"
            }
            Text {
                width: Math.min(parent.width - 48, 480)
                anchors.horizontalCenter: parent.horizontalCenter
                text: root.screen.message
                color: SystemStyle.secondaryText
                font.pixelSize: SystemStyle.bodySize
                horizontalAlignment: Text.AlignHCenter
                wrapMode: Text.WordWrap
                Accessible.role: Accessible.StaticText
                Accessible.name: text
            }
        }
    }
}
