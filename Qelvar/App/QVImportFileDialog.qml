import QtCore
import QtQuick
import QtQuick.Templates as T
import Qt.labs.folderlistmodel

// Chooses the file to import: a sheet of our own, since the toolkit's stand-in for a desktop's dialog does not fit a
// phone. Loaded when it is first needed.
T.Popup {
    id: dialog
    objectName: "importFileDialog"
    property string title: ""
    property string filterName: ""
    property var selectedFiles: []
    signal accepted

    parent: T.Overlay.overlay
    x: Math.round((parent.width - width) / 2)
    y: Math.round((parent.height - height) / 2)
    width: Math.min(parent.width - 16, 560)
    height: Math.min(parent.height - 48, 720)
    modal: true
    focus: true
    closePolicy: T.Popup.CloseOnEscape
    T.Overlay.modal: Rectangle { color: "#66000000" }
    background: Rectangle { color: SystemStyle.background; radius: 12 }
    onOpened: files.forceActiveFocus()

    function choose(index) {
        const folder = model.get(index, "fileIsDir")
        const url = model.get(index, "fileUrl")
        if (folder) {
            model.folder = url
            files.currentIndex = 0
        } else {
            selectedFiles = [url]
            close()
            accepted()
        }
    }
    function goUp() {
        if (model.parentFolder.toString().length > 0) model.folder = model.parentFolder
        files.currentIndex = 0
    }

    FolderListModel {
        id: model
        folder: StandardPaths.writableLocation(StandardPaths.HomeLocation)
        nameFilters: ["*.xml", "*.zip"]
        caseSensitive: false
        showDirsFirst: true
    }

    contentItem: Item {
        Accessible.role: Accessible.Dialog
        Accessible.name: dialog.title

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
        T.Button { // up to the folder around this one
            id: up
            anchors { top: heading.bottom; topMargin: 8; left: parent.left; right: parent.right }
            height: SystemStyle.touchHeight
            enabled: model.parentFolder.toString().length > 0
            text: decodeURIComponent(model.folder.toString().replace(/^file:\/\//, "")) || "/"
            onClicked: dialog.goUp()
            Accessible.name: text
            Accessible.role: Accessible.Button
            Keys.onReturnPressed: clicked()
            contentItem: Text {
                leftPadding: 16
                rightPadding: 16
                text: (up.enabled ? "\u2191  " : "") + up.text
                font.pixelSize: SystemStyle.captionSize
                color: up.enabled ? SystemStyle.tint : SystemStyle.secondaryText
                verticalAlignment: Text.AlignVCenter
                elide: Text.ElideMiddle
            }
            background: Rectangle { color: up.down ? SystemStyle.emphasis : SystemStyle.groupedBackground }
            FocusRing { shown: up.visualFocus }
        }
        ListView {
            id: files
            anchors { top: up.bottom; left: parent.left; right: parent.right; bottom: line.top }
            clip: true
            activeFocusOnTab: true
            boundsBehavior: Flickable.StopAtBounds
            model: model
            Accessible.role: Accessible.List
            Accessible.name: dialog.filterName
            Keys.onReturnPressed: if (currentIndex >= 0) dialog.choose(currentIndex)
            Keys.onEnterPressed: if (currentIndex >= 0) dialog.choose(currentIndex)
            Keys.onPressed: event => {
                if (event.key === Qt.Key_Backspace) {
                    dialog.goUp()
                    event.accepted = true
                }
            }
            delegate: T.ItemDelegate {
                id: row
                required property int index
                required property string fileName
                required property bool fileIsDir
                width: files.width
                height: SystemStyle.touchHeight
                highlighted: files.activeFocus && files.currentIndex === index
                text: fileName
                onClicked: dialog.choose(index)
                Accessible.name: fileName
                contentItem: Item {
                    Text {
                        anchors { left: parent.left; leftMargin: 16; right: arrow.left; rightMargin: 8; verticalCenter: parent.verticalCenter }
                        text: row.fileName
                        font.pixelSize: SystemStyle.scaled(15)
                        color: row.fileIsDir ? SystemStyle.text : SystemStyle.tint
                        elide: Text.ElideMiddle
                    }
                    Text {
                        id: arrow
                        anchors { right: parent.right; rightMargin: 16; verticalCenter: parent.verticalCenter }
                        visible: row.fileIsDir
                        text: row.mirrored ? "\u2039" : "\u203a"
                        font.pixelSize: SystemStyle.scaled(20)
                        color: SystemStyle.inactive
                    }
                }
                background: Rectangle {
                    color: row.down || row.highlighted ? SystemStyle.emphasis : "transparent"
                    Rectangle {
                        anchors { left: parent.left; leftMargin: 16; right: parent.right; bottom: parent.bottom }
                        height: SystemStyle.pixel
                        color: SystemStyle.emphasis
                    }
                }
            }
            Text {
                anchors { left: parent.left; right: parent.right; verticalCenter: parent.verticalCenter; margins: 24 }
                visible: files.count === 0 && model.status === FolderListModel.Ready
                text: qsTrId("IMPORT_NO_RECORDS_FILE")
                font.pixelSize: SystemStyle.scaled(15)
                color: SystemStyle.secondaryText
                horizontalAlignment: Text.AlignHCenter
                wrapMode: Text.WordWrap
            }
        }
        Rectangle {
            id: line
            anchors { left: parent.left; right: parent.right; bottom: cancel.top }
            height: SystemStyle.pixel
            color: SystemStyle.hairline
        }
        SystemButton {
            id: cancel
            anchors { left: parent.left; right: parent.right; bottom: parent.bottom }
            text: qsTrId("CANCEL")
            onClicked: dialog.close()
        }
    }
}
