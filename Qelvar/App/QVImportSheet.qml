import QtQuick
import Qelvar.Items

// Progress and result of an import.
SystemSheet {
    id: sheet
    objectName: "importSheet"
    property var controller: null
    readonly property bool running: controller.state === QVImportController.Running || controller.state === QVImportController.Cancelling
    // The keyboard is on the first button of whatever is shown.
    function focusFirst() {
        const first = buttons.itemAt(0)
        if (first) first.forceActiveFocus()
        else keys.forceActiveFocus()
    }
    Connections {
        target: sheet.controller
        function onButtonsChanged() { if (sheet.opened) Qt.callLater(sheet.focusFirst) }
    }
    title: controller.title
    implicitHeight: body.implicitHeight + line.height + buttonColumn.height + 2
    visible: controller.isShown
    onOpened: focusFirst()

    FocusScope {
        id: keys
        anchors.fill: parent
        focus: true
        Keys.onEscapePressed: sheet.controller.leave()
        Keys.onBackPressed: sheet.controller.leave()
        Keys.onUpPressed: scroller.flick(0, 600)
        Keys.onDownPressed: scroller.flick(0, -600)

        Flickable { // what does not fit is scrolled, and the button stays
            id: scroller
            anchors { left: parent.left; right: parent.right; top: parent.top; bottom: line.top }
            contentHeight: body.implicitHeight
            interactive: contentHeight > height
            clip: interactive
            boundsBehavior: Flickable.StopAtBounds
            Column {
                id: body
                width: parent.width
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
                    wrapMode: Text.WordWrap
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
                    font.pixelSize: SystemStyle.captionSize
                    color: SystemStyle.secondaryText
                    horizontalAlignment: Text.AlignHCenter
                    wrapMode: Text.Wrap
                    maximumLineCount: 8
                    elide: Text.ElideRight
                    Accessible.role: Accessible.StaticText
                    Accessible.name: text
                }
                Item { // progress
                    visible: sheet.running && sheet.controller.fraction >= 0
                    width: parent.width
                    height: 28
                    Rectangle {
                        id: track
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
                Column { // result
                    width: parent.width
                    topPadding: 12
                    visible: rows.count > 0
                    Repeater {
                        id: rows
                        model: sheet.controller.rowTitles
                        Item {
                            required property string modelData
                            required property int index
                            readonly property string value: sheet.controller.rowValues[index] ?? ""
                            width: body.width
                            height: Math.max(SystemStyle.grown(28, 20), rowTitle.height + 6)
                            Accessible.role: Accessible.StaticText
                            Accessible.name: modelData + ": " + value
                            Text {
                                id: rowTitle
                                anchors { left: parent.left; leftMargin: 24; right: rowValue.left; rightMargin: 8; verticalCenter: parent.verticalCenter }
                                horizontalAlignment: Text.AlignLeft
                                wrapMode: Text.Wrap
                                text: parent.modelData
                                font.pixelSize: SystemStyle.scaled(15)
                                color: SystemStyle.text
                            }
                            Text {
                                id: rowValue
                                anchors { right: parent.right; rightMargin: 24; verticalCenter: parent.verticalCenter }
                                text: parent.value
                                font.pixelSize: SystemStyle.scaled(15)
                                color: SystemStyle.secondaryText
                            }
                        }
                    }
                }
                ListView {
                    id: refusals
                    width: parent.width
                    visible: count > 0
                    height: visible ? Math.min(contentHeight, 160, Math.max(60, sheet.parent.height - 360)) : 0
                    clip: true
                    activeFocusOnTab: true
                    boundsBehavior: Flickable.StopAtBounds
                    model: sheet.controller.details
                    Keys.onUpPressed: flick(0, 600)
                    Keys.onDownPressed: flick(0, -600)
                    Accessible.role: Accessible.List
                    delegate: Text {
                        required property string modelData
                        width: refusals.width
                        leftPadding: 24
                        rightPadding: 24
                        topPadding: 4
                        text: modelData
                        font.pixelSize: SystemStyle.scaled(12)
                        color: SystemStyle.secondaryText
                        wrapMode: Text.Wrap
                        Accessible.role: Accessible.ListItem
                        Accessible.name: text
                    }
                    FocusRing { shown: refusals.activeFocus }
                }
                Item { width: 1; height: 12 }
            }
        }
        Rectangle {
            id: line
            anchors { left: parent.left; right: parent.right; bottom: buttonColumn.top }
            height: SystemStyle.pixel
            color: SystemStyle.hairline
        }
        Column {
            id: buttonColumn
            anchors { left: parent.left; right: parent.right; bottom: parent.bottom }
            Repeater {
                id: buttons
                model: sheet.controller.buttonTitles
                SystemButton {
                    required property string modelData
                    required property int index
                    width: buttonColumn.width
                    emphasized: index === 0
                    text: modelData
                    onClicked: sheet.controller.pressButton(index)
                    Keys.onUpPressed: if (index > 0) buttons.itemAt(index - 1).forceActiveFocus()
                    Keys.onDownPressed: if (index + 1 < buttons.count) buttons.itemAt(index + 1).forceActiveFocus()
                }
            }
        }
    }
}
