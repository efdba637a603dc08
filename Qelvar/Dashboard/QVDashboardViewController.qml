import QtQuick
import QtQuick.Templates as T
import Qelvar.Items

FocusScope {
    id: root
    property var screen: null
    readonly property bool hasPalette: true

    Rectangle { anchors.fill: parent; color: SystemStyle.background }

    // The palette at the bottom edge of the navigation bar.
    Rectangle {
        id: paletteBar
        width: parent.width
        height: 39
        color: SystemStyle.bar
        z: 1
        QVTimeScopeControlBar {
            anchors.fill: parent
            control: root.screen.timeScopeControl
        }
        Rectangle {
            anchors.bottom: parent.bottom
            width: parent.width
            height: SystemStyle.pixel
            color: SystemStyle.hairline
        }
    }

    ListView {
        id: table
        anchors.fill: parent
        anchors.topMargin: paletteBar.height
        clip: true
        bottomMargin: 4
        cacheBuffer: 187
        interactive: !root.screen.showsEmptyState
        boundsBehavior: Flickable.DragOverBounds
        focus: true
        activeFocusOnTab: true
        keyNavigationEnabled: true
        highlightFollowsCurrentItem: false
        model: root.screen.table
        header: Item { width: 1; height: SystemStyle.pixel }
        Accessible.role: Accessible.List
        Accessible.name: root.screen.title
        // Only the keyboard moves the list to the current card: a card inserted above it, or a finger on one that is half
        // in sight, must not.
        property bool byKeyboard: false
        Keys.onPressed: event => {
            byKeyboard = true
            event.accepted = false
        }
        onCurrentIndexChanged: if (byKeyboard) positionViewAtIndex(currentIndex, ListView.Contain)

        delegate: T.AbstractButton {
            id: row
            required property int index
            required property string displayName
            width: ListView.view ? ListView.view.width : 0
            height: 187
            focusPolicy: Qt.StrongFocus
            text: displayName
            onClicked: root.screen.selectRow(index)
            Keys.onReturnPressed: row.clicked()
            Keys.onEnterPressed: row.clicked()
            onPressed: table.byKeyboard = false
            onActiveFocusChanged: if (activeFocus) ListView.view.currentIndex = index
            onVisualFocusChanged: if (visualFocus) table.positionViewAtIndex(index, ListView.Contain)
            Accessible.role: Accessible.Button
            Accessible.name: displayName + (cell.accessibleValue ? ", " + cell.accessibleValue : "")
            contentItem: QVDashboardTableViewCell {
                id: cell
                screen: root.screen
                row: row.index
            }
            FocusRing { anchors.margins: 4; shown: row.visualFocus || (row.activeFocus && table.byKeyboard) }
        }
    }

    Item {
        id: emptyState
        anchors.fill: table
        visible: root.screen.showsEmptyState
        readonly property real helpMargin: root.screen.emptyStateHelpMargin(width)
        Icon {
            id: icon
            anchors.horizontalCenter: parent.horizontalCenter
            anchors.bottom: parent.verticalCenter
            width: 64
            height: 64
            name: "dashboard_glyph_emptydashboard"
        }
        Text {
            id: emptyTitle
            width: parent.width
            y: icon.y + icon.height + 47 - height
            text: root.screen.emptyStateTitle
            horizontalAlignment: Text.AlignHCenter
            font.pixelSize: 27
            fontSizeMode: Text.HorizontalFit
            minimumPixelSize: 15
            maximumLineCount: 1
            color: SystemStyle.inactive
            Accessible.role: Accessible.StaticText
            Accessible.name: text
        }
        Text {
            id: help
            anchors.top: emptyTitle.bottom
            anchors.topMargin: 10
            anchors.left: parent.left
            anchors.right: parent.right
            anchors.leftMargin: emptyState.helpMargin
            anchors.rightMargin: emptyState.helpMargin
            text: root.screen.emptyStateHelp
            horizontalAlignment: Text.AlignHCenter
            wrapMode: Text.WordWrap
            font.pixelSize: 18
            color: SystemStyle.inactive
            Accessible.role: Accessible.StaticText
            Accessible.name: text
        }
        SystemButton {
            anchors.top: help.bottom
            anchors.topMargin: 8
            anchors.horizontalCenter: parent.horizontalCenter
            text: root.screen.importTitle
            onClicked: root.screen.importRequested()
        }
    }
}
