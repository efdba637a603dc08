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
    function chooseFiles() { // one import at a time
        if (app.importController.isWorking) app.importController.show()
        else fileDialog.open()
    }
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
        anchors.bottomMargin: tabBar.height + transfers.height
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

    Column { // work that was put aside
        id: transfers
        anchors.bottom: tabBar.top
        width: parent.width
        QVTransferRow { width: parent.width; controller: root.app.importController }
        QVTransferRow { width: parent.width; controller: root.app.exportController }
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
                    required property bool showsTransfers
                    readonly property bool selected: root.tabs.selectedIndex === index
                    // The work put aside that was begun here.
                    readonly property var transfer: !showsTransfers ? null
                        : root.app.exportController.isAside ? root.app.exportController
                        : root.app.importController.isAside ? root.app.importController : null
                    width: tabBar.width / root.tabs.rowCount()
                    height: tabBar.height
                    text: title
                    focusPolicy: Qt.TabFocus
                    onClicked: root.tabs.tap(index)
                    Keys.onReturnPressed: tab.clicked()
                    Keys.onEnterPressed: tab.clicked()
                    Accessible.role: Accessible.PageTab
                    Accessible.onPressAction: tab.clicked()
                    Accessible.name: title
                    Accessible.description: transfer ? transfer.statusText : ""
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
                    Rectangle { // under the icon
                        anchors.horizontalCenter: parent.horizontalCenter
                        y: 2
                        width: 30
                        height: 3
                        radius: 1.5
                        visible: tab.transfer !== null
                        color: SystemStyle.emphasis
                        Rectangle {
                            anchors.left: parent.left
                            height: parent.height
                            radius: 1.5
                            color: SystemStyle.tint
                            width: parent.width * (tab.transfer ? Math.max(0, tab.transfer.fraction) : 0)
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
        onActivated: root.chooseFiles()
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
        function onImportRequested() { root.chooseFiles() }
    }
    Announcement {
        width: 1
        height: 1
        Accessible.role: Accessible.Notification
        Accessible.name: text
    }
    Loader { // the sheet of an import: made for the first one
        id: importSheet
        readonly property bool needed: root.app.importController.isShown
        onNeededChanged: if (needed && !item) setSource("QVImportSheet.qml", { controller: root.app.importController })
    }
    Loader { // the sheet of an export, likewise
        readonly property bool needed: root.app.exportController.isShown
        onNeededChanged: if (needed && !item) setSource("QVExportSheet.qml", { objectName: "exportSheet", controller: root.app.exportController })
    }
    Loader { // the question whether to give up what runs
        readonly property bool needed: root.app.quitController.isShown
        onNeededChanged: if (needed && !item) setSource("QVExportSheet.qml", { objectName: "quitSheet", controller: root.app.quitController })
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
