import QtCore
import QtQuick
import QtQuick.Templates as T
import Qt.labs.folderlistmodel
import Qelvar.Items

// Chooses where to save the archive, where the desktop has no dialog for that. Loaded when it is first needed.
SystemSheet {
    id: dialog
    objectName: "exportSaveDialog"
    property var controller: null
    title: controller.saveTitle
    implicitHeight: 560
    onAboutToShow: {
        name.text = controller.suggestedName
        check()
    }
    onOpened: name.forceActiveFocus()

    property bool replaces: false
    function check() { replaces = controller.fileExists(model.folder, name.text.trim()) }
    function save() {
        const chosen = name.text.trim()
        if (chosen.length === 0 || chosen.includes("/")) return
        close()
        controller.saveIn(model.folder, chosen)
    }

    FolderListModel {
        id: model
        folder: StandardPaths.writableLocation(StandardPaths.HomeLocation)
        showFiles: false
        onFolderChanged: dialog.check()
    }

    FocusScope {
        anchors.fill: parent
        focus: true
        Keys.onEscapePressed: dialog.close()
        Keys.onBackPressed: dialog.close()

        Text {
            id: heading
            anchors { top: parent.top; left: parent.left; right: parent.right; margins: 14 }
            text: dialog.title
            font.pixelSize: SystemStyle.bodySize
            font.bold: true
            color: SystemStyle.text
            horizontalAlignment: Text.AlignHCenter
            wrapMode: Text.Wrap
            Accessible.role: Accessible.Heading
            Accessible.name: text
        }
        Rectangle {
            id: field
            anchors { top: heading.bottom; left: parent.left; right: parent.right; margins: 12 }
            height: SystemStyle.touchHeight
            radius: 8
            color: SystemStyle.groupedBackground
            TextInput {
                id: name
                anchors { fill: parent; leftMargin: 12; rightMargin: 12 }
                verticalAlignment: Text.AlignVCenter
                font.pixelSize: SystemStyle.bodySize
                color: SystemStyle.text
                selectionColor: SystemStyle.tint
                clip: true
                activeFocusOnTab: true
                KeyNavigation.tab: up
                onTextChanged: dialog.check()
                onAccepted: dialog.save()
                Accessible.role: Accessible.EditableText
                Accessible.name: qsTrId("EXPORT_FILE_NAME")
            }
            FocusRing { shown: name.activeFocus }
        }
        SystemButton {
            id: up
            anchors { top: field.bottom; topMargin: 4; left: parent.left; right: parent.right; leftMargin: 12; rightMargin: 12 }
            enabled: model.parentFolder.toString().length > 0
            readonly property string path: decodeURIComponent(model.folder.toString().replace(/^file:\/\//, "")) || "/"
            text: (enabled ? "\u2191  " : "") + path
            onClicked: model.folder = model.parentFolder
        }
        ListView {
            id: folders
            anchors { top: up.bottom; left: parent.left; right: parent.right; bottom: save.top }
            clip: true
            activeFocusOnTab: true
            boundsBehavior: Flickable.StopAtBounds
            model: model
            Accessible.role: Accessible.List
            Accessible.name: up.path
            Keys.onReturnPressed: enter(currentIndex)
            Keys.onEnterPressed: enter(currentIndex)
            function enter(index) {
                if (index < 0) return
                model.folder = model.get(index, "fileUrl")
                currentIndex = 0
            }
            delegate: T.ItemDelegate {
                id: row
                required property int index
                required property string fileName
                width: folders.width
                height: SystemStyle.touchHeight
                highlighted: folders.activeFocus && folders.currentIndex === index
                text: fileName
                onClicked: folders.enter(index)
                Accessible.name: fileName
                contentItem: Text {
                    leftPadding: 16
                    rightPadding: 16
                    text: row.fileName
                    textFormat: Text.PlainText
                    font.pixelSize: SystemStyle.bodySize
                    color: SystemStyle.text
                    verticalAlignment: Text.AlignVCenter
                    horizontalAlignment: Text.AlignLeft
                    elide: Text.ElideMiddle
                }
                background: Rectangle { color: row.down || row.highlighted ? SystemStyle.emphasis : "transparent" }
            }
        }
        SystemButton {
            id: save
            anchors { left: parent.left; right: parent.right; bottom: cancel.top }
            emphasized: true
            enabled: name.text.trim().length > 0
            text: dialog.replaces ? qsTrId("EXPORT_REPLACE") : qsTrId("EXPORT_SAVE")
            onClicked: dialog.save()
        }
        SystemButton {
            id: cancel
            anchors { left: parent.left; right: parent.right; bottom: parent.bottom }
            text: qsTrId("CANCEL")
            onClicked: dialog.close()
        }
    }
}
