import QtQuick
import QtQuick.Templates as T
import Qelvar.Items

// The window's content: the selected tab's screens above the tab bar.
FocusScope {
    id: root
    property var app: null
    readonly property var tabs: app.tabBarController
    // Something slides.
    readonly property bool busy: busyStacks > 0
    property int busyStacks: 0
    focus: true
    LayoutMirroring.enabled: app.rightToLeft
    LayoutMirroring.childrenInherit: true

    Component.onCompleted: SystemStyle.keyColor = app.keyColor
    Binding {
        target: SystemStyle
        property: "pixel"
        value: 1 / Screen.devicePixelRatio
    }

    Item {
        id: stacks
        anchors.fill: parent
        anchors.bottomMargin: tabBar.height
        Repeater {
            id: repeater
            model: root.tabs
            Loader {
                required property int index
                required property var stack
                readonly property bool selected: root.tabs.selectedIndex === index
                anchors.fill: parent
                visible: selected
                focus: selected
                active: false // made when it is first shown, then kept
                onSelectedChanged: if (selected) show()
                Component.onCompleted: if (selected) show()
                onLoaded: item.forceActiveFocus()
                function show() {
                    active = true
                    if (item) item.forceActiveFocus()
                }
                sourceComponent: NavigationStackView {
                    stack: parent.stack
                    mirrored: root.app.rightToLeft
                    focus: true
                    onBusyChanged: root.busyStacks += busy ? 1 : -1
                }
            }
        }
    }

    Rectangle {
        id: tabBar
        anchors.bottom: parent.bottom
        width: parent.width
        height: SystemStyle.tabBarHeight
        color: SystemStyle.bar
        Accessible.role: Accessible.PageTabList
        Accessible.name: root.app.tabBarName
        Rectangle { width: parent.width; height: SystemStyle.pixel; color: SystemStyle.hairline }
        Row {
            anchors.fill: parent
            Repeater {
                model: root.tabs
                T.AbstractButton {
                    id: tab
                    required property int index
                    required property string title
                    required property string image
                    required property string selectedImage
                    readonly property bool selected: root.tabs.selectedIndex === index
                    width: tabBar.width / root.tabs.rowCount()
                    height: tabBar.height
                    text: title
                    focusPolicy: Qt.TabFocus
                    onClicked: root.tabs.tap(index)
                    Keys.onReturnPressed: tab.clicked()
                    Keys.onEnterPressed: tab.clicked()
                    Accessible.role: Accessible.PageTab
                    Accessible.name: title
                    Accessible.selectable: true
                    Accessible.selected: selected
                    contentItem: Item {
                        Icon {
                            anchors.horizontalCenter: parent.horizontalCenter
                            y: 5
                            width: 26
                            height: 26
                            name: tab.selected ? tab.selectedImage : tab.image
                            tint: tab.selected ? SystemStyle.tint : SystemStyle.inactive
                        }
                        Text {
                            anchors.horizontalCenter: parent.horizontalCenter
                            y: 33
                            width: parent.width - 4
                            horizontalAlignment: Text.AlignHCenter
                            height: parent.height - y
                            text: tab.title
                            font.pixelSize: SystemStyle.scaled(10)
                            fontSizeMode: SystemStyle.largeText ? Text.Fit : Text.FixedSize
                            minimumPixelSize: 8
                            wrapMode: SystemStyle.largeText ? Text.WordWrap : Text.NoWrap
                            color: tab.selected ? SystemStyle.tint : SystemStyle.inactive
                            elide: Text.ElideRight
                        }
                    }
                    FocusRing { anchors.margins: 2; shown: tab.visualFocus }
                }
            }
        }
    }

    Repeater { // Ctrl+1 to Ctrl+4
        model: root.tabs
        Item {
            id: numbered
            required property int index
            Shortcut {
                sequence: "Ctrl+" + (numbered.index + 1)
                onActivated: root.tabs.tap(numbered.index)
            }
        }
    }
    Shortcut {
        sequences: [StandardKey.Open]
        onActivated: fileDialog.open()
    }
    Shortcut {
        sequences: [StandardKey.Quit]
        onActivated: Qt.quit()
    }

    DropArea {
        id: drop
        anchors.fill: parent
        keys: ["text/uri-list"]
        onDropped: event => {
            event.acceptProposedAction()
            root.app.importController.importUrls(event.urls)
        }
        Rectangle {
            anchors.fill: parent
            visible: drop.containsDrag
            color: Qt.alpha(SystemStyle.tint, 0.12)
            border.width: 3
            border.color: SystemStyle.tint
        }
    }

    Loader {
        id: fileDialog
        active: false
        source: "QVImportFileDialog.qml"
        function open() {
            active = true
            if (item) item.open()
        }
        onLoaded: {
            item.title = Qt.binding(() => root.app.importController.chooseTitle)
            item.filterName = Qt.binding(() => root.app.importController.filterName)
            item.accepted.connect(() => root.app.importController.importUrls(item.selectedFiles))
        }
    }
    Connections {
        target: root.app
        function onImportRequested() { fileDialog.open() }
    }
    Announcement {
        width: 1
        height: 1
        Accessible.role: Accessible.Notification
        Accessible.name: text
    }
    Loader { // the sheet of an import: made for the first one
        id: importSheet
        readonly property bool needed: root.app.importController.state !== QVImportController.Idle
        onNeededChanged: if (needed && !item) setSource("QVImportSheet.qml", { controller: root.app.importController })
    }
    Loader { // the sheet of an export, likewise
        readonly property bool needed: root.app.exportController.state !== QVExportController.Idle
        onNeededChanged: if (needed && !item) setSource("QVExportSheet.qml", { controller: root.app.exportController })
    }
    Loader {
        id: saveDialog
        onLoaded: item.open()
    }
    Connections {
        target: root.app.exportController
        function onSaveDialogRequested() {
            if (saveDialog.item) saveDialog.item.open()
            else saveDialog.setSource("QVExportSaveDialog.qml", { controller: root.app.exportController })
        }
    }
}
