import QtQuick
import QtQuick.Templates as T
import Qelvar.Items

// Work that was put aside: how far it is, above the tabs. A press brings its sheet back.
Item {
    id: row
    property var controller: null
    objectName: "transferRow"
    visible: controller.isAside
    height: visible ? SystemStyle.touchHeight : 0

    Rectangle { anchors.fill: parent; color: SystemStyle.bar }
    T.AbstractButton {
        id: open
        anchors { left: parent.left; right: cancel.visible ? cancel.left : parent.right; top: parent.top; bottom: parent.bottom }
        text: row.controller.title
        focusPolicy: Qt.StrongFocus
        onClicked: row.controller.show()
        Keys.onReturnPressed: clicked()
        Keys.onEnterPressed: clicked()
        Accessible.role: Accessible.Button
        Accessible.onPressAction: clicked()
        Accessible.name: row.controller.statusText
        Accessible.description: qsTrId("TRANSFER_SHOW")
        contentItem: Item {
            Text {
                id: name
                anchors { left: parent.left; leftMargin: 16; right: percent.left; rightMargin: 8; top: parent.top; topMargin: 4; bottom: parent.bottom; bottomMargin: 4 }
                text: open.text
                verticalAlignment: Text.AlignVCenter
                wrapMode: Text.WordWrap // a large text in a narrow window has two lines
                fontSizeMode: Text.Fit
                minimumPixelSize: 8
                font.pixelSize: SystemStyle.captionSize
                font.bold: true
                color: SystemStyle.text
                horizontalAlignment: Text.AlignLeft
                elide: Text.ElideRight
            }
            Text {
                id: percent
                anchors { right: parent.right; rightMargin: 12; verticalCenter: parent.verticalCenter }
                text: row.controller.isWorking ? row.controller.progressText : qsTrId("TRANSFER_SHOW")
                font.pixelSize: SystemStyle.captionSize
                color: row.controller.isWorking ? SystemStyle.secondaryText : SystemStyle.tint
            }
        }
        background: Rectangle { color: open.down ? SystemStyle.emphasis : "transparent" }
        FocusRing { anchors.margins: 2; shown: open.visualFocus }
    }
    SystemButton {
        id: cancel
        anchors { right: parent.right; rightMargin: 8; top: parent.top; bottom: parent.bottom }
        visible: row.controller.isWorking
        text: qsTrId("CANCEL")
        Accessible.description: row.controller.title
        onClicked: row.controller.cancel()
    }
    Rectangle { width: parent.width; height: SystemStyle.pixel; color: SystemStyle.hairline }
    Rectangle {
        anchors { left: parent.left; right: parent.right; bottom: parent.bottom }
        visible: row.controller.isWorking && row.controller.fraction >= 0
        height: 3
        color: SystemStyle.emphasis
        Accessible.role: Accessible.ProgressBar
        Accessible.name: row.controller.statusText
        Rectangle {
            anchors.left: parent.left
            height: parent.height
            color: SystemStyle.tint
            width: parent.width * Math.max(0, row.controller.fraction)
        }
    }
}
