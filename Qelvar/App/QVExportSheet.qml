import QtQuick
import Qelvar.Items

// A question of the application, progress, what can be done with a result: a title, a message and buttons.
SystemSheet {
    id: sheet
    property var controller: null
    title: controller.title
    implicitHeight: body.implicitHeight + 2
    visible: controller.isShown
    onOpened: focusFirst()

    // The keyboard is on the first button of whatever is shown.
    function focusFirst() {
        const first = buttons.itemAt(0)
        if (first) first.forceActiveFocus()
        else content.forceActiveFocus()
    }
    Connections {
        target: sheet.controller
        function onButtonsChanged() { if (sheet.opened) Qt.callLater(sheet.focusFirst) }
    }

    Flickable {
        id: content
        anchors.fill: parent
        contentHeight: body.implicitHeight
        clip: true
        focus: true
        boundsBehavior: Flickable.StopAtBounds
        Keys.onEscapePressed: sheet.controller.leave()
        Keys.onBackPressed: sheet.controller.leave()
        function reveal(item) {
            const top = item.mapToItem(body, 0, 0).y
            contentY = Math.max(0, Math.min(top, Math.max(contentY, top + item.height - height)))
        }

        Column {
            id: body
            width: content.width
            Text {
                width: parent.width
                topPadding: 18
                leftPadding: 16
                rightPadding: 16
                text: sheet.controller.title
                font.pixelSize: SystemStyle.bodySize
                font.bold: true
                color: SystemStyle.text
                horizontalAlignment: Text.AlignHCenter
                wrapMode: Text.Wrap
                Accessible.role: Accessible.Heading
                Accessible.name: text
            }
            Text {
                width: parent.width
                visible: text.length > 0
                topPadding: 6
                leftPadding: 16
                rightPadding: 16
                text: sheet.controller.message
                textFormat: Text.PlainText
                font.pixelSize: SystemStyle.captionSize
                color: SystemStyle.secondaryText
                horizontalAlignment: Text.AlignHCenter
                wrapMode: Text.Wrap
                Accessible.role: Accessible.StaticText
                Accessible.name: text
            }
            Item {
                visible: sheet.controller.fraction >= 0
                width: parent.width
                height: 28
                Rectangle {
                    anchors.centerIn: parent
                    width: parent.width - 48
                    height: 4
                    radius: 2
                    color: SystemStyle.emphasis
                    Accessible.role: Accessible.ProgressBar
                    Accessible.name: sheet.controller.statusText
                    Accessible.description: sheet.controller.message
                    Rectangle {
                        anchors.left: parent.left
                        height: parent.height
                        radius: 2
                        color: SystemStyle.tint
                        width: parent.width * Math.max(0, sheet.controller.fraction)
                    }
                }
            }
            Item { width: 1; height: 12 }
            Repeater {
                id: buttons
                model: sheet.controller.buttonTitles
                Column {
                    id: row
                    required property string modelData
                    required property int index
                    width: body.width
                    function forceActiveFocus() { button.forceActiveFocus() }
                    Rectangle { width: parent.width; height: SystemStyle.pixel; color: SystemStyle.hairline }
                    SystemButton {
                        id: button
                        width: parent.width
                        text: row.modelData
                        emphasized: row.index === 0
                        onClicked: sheet.controller.pressButton(row.index)
                        onActiveFocusChanged: if (activeFocus) content.reveal(row)
                        Keys.onUpPressed: if (row.index > 0) buttons.itemAt(row.index - 1).forceActiveFocus()
                        Keys.onDownPressed: if (row.index + 1 < buttons.count) buttons.itemAt(row.index + 1).forceActiveFocus()
                    }
                }
            }
        }
    }
}
