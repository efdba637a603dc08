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
        height: SystemStyle.grown(39, 18)
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
        readonly property var screen: root.screen
        anchors.fill: parent
        anchors.topMargin: paletteBar.height
        clip: true
        bottomMargin: 4
        cacheBuffer: screen.rowHeight
        interactive: !screen.showsEmptyState && !screen.dragging
        boundsBehavior: Flickable.DragOverBounds
        focus: true
        activeFocusOnTab: true
        keyNavigationEnabled: !screen.dragging
        highlightFollowsCurrentItem: false
        model: screen.table
        header: Item { width: 1; height: SystemStyle.pixel }
        Accessible.role: Accessible.List
        Accessible.name: screen.title
        Accessible.description: screen.moveHelp

        // The screen computes with what the table looks like, and says where it is to be.
        function tellGeometry() { if (screen) screen.setTableGeometry(width, visible ? height : 0, SystemStyle.pixel, screen.rowHeight, bottomMargin) }
        function tellOffset() { screen.tableDidScroll(contentY - originY) }
        onWidthChanged: tellGeometry()
        onHeightChanged: tellGeometry()
        onVisibleChanged: tellGeometry() // scrolled while it is covered it would not stay so
        onContentYChanged: tellOffset()
        onOriginYChanged: tellOffset()
        Component.onCompleted: tellGeometry()
        Connections {
            target: SystemStyle
            function onPixelChanged() { table.tellGeometry() }
        }
        Connections {
            target: table.screen
            function onRowHeightChanged() { table.tellGeometry() }
            function onScrollRequested(offset) {
                table.forceLayout()
                table.contentY = table.originY + offset
            }
        }

        // Cards make room for the one that is dragged.
        Transition { id: makeRoom; NumberAnimation { property: "y"; duration: 250; easing.type: Easing.InOutQuad } }
        moveDisplaced: screen.dragging && SystemStyle.animated ? makeRoom : null
        move: screen.dragging && SystemStyle.animated ? makeRoom : null

        // Only the keyboard moves the list to the current card: a card inserted above it, or a finger on one that is half
        // in sight, must not.
        property bool byKeyboard: false
        readonly property int rowsInSight: Math.max(1, Math.floor(height / screen.rowHeight))
        function show(row) {
            forceLayout()
            positionViewAtIndex(row, ListView.Contain)
        }
        function goTo(row) { if (!screen.dragging) currentIndex = Math.max(0, Math.min(row, count - 1)) }
        Keys.onPressed: event => {
            byKeyboard = true
            event.accepted = true
            if (event.key === Qt.Key_Home) goTo(0)
            else if (event.key === Qt.Key_End) goTo(count - 1)
            else if (event.key === Qt.Key_PageUp) goTo(currentIndex - rowsInSight)
            else if (event.key === Qt.Key_PageDown) goTo(currentIndex + rowsInSight)
            else event.accepted = false
        }
        onCurrentIndexChanged: if (byKeyboard) positionViewAtIndex(currentIndex, ListView.Contain)

        delegate: T.AbstractButton {
            id: row
            required property int index
            required property string displayName
            width: ListView.view ? ListView.view.width : 0
            height: root.screen.rowHeight
            focusPolicy: Qt.StrongFocus
            text: displayName
            // By the keyboard or a screen reader; pointers are the area's above.
            onClicked: root.screen.selectRow(index)
            Keys.onReturnPressed: row.clicked()
            Keys.onEnterPressed: row.clicked()
            Keys.onPressed: event => {
                const places = event.key === Qt.Key_Up ? -1 : event.key === Qt.Key_Down ? 1 : 0
                if (places === 0 || !(event.modifiers & Qt.AltModifier)) return
                event.accepted = true
                moveBy(places)
            }
            function moveBy(places) {
                table.byKeyboard = true
                root.screen.moveCard(index, places)
                table.show(index)
            }
            onActiveFocusChanged: if (activeFocus) ListView.view.currentIndex = index
            onVisualFocusChanged: if (visualFocus && !root.screen.dragging) table.positionViewAtIndex(index, ListView.Contain)
            Accessible.role: Accessible.Button
            Accessible.name: displayName + (cell.accessibleValue ? ", " + cell.accessibleValue : "")
            Accessible.description: cell.chartDescription
            // Up the list, and down.
            Accessible.onDecreaseAction: moveBy(-1)
            Accessible.onIncreaseAction: moveBy(1)
            contentItem: QVDashboardTableViewCell {
                id: cell
                screen: root.screen
                row: row.index
            }
            FocusRing { anchors.margins: 4; shown: row.visualFocus || (row.activeFocus && table.byKeyboard) }
        }

        // Above the rows and not of one of them: a row that is dragged out of sight goes, and its finger stays.
        MouseArea {
            parent: table
            anchors.fill: parent
            z: 2
            visible: !root.screen.showsEmptyState
            pressAndHoldInterval: 500
            preventStealing: root.screen.dragging
            onPressed: mouse => {
                table.byKeyboard = false
                const pressed = table.itemAtIndex(root.screen.rowAt(mouse.y))
                if (pressed) pressed.forceActiveFocus(Qt.MouseFocusReason)
            }
            onClicked: mouse => root.screen.selectRow(root.screen.rowAt(mouse.y))
            onPressAndHold: mouse => root.screen.pressAndHoldBegan(mouse.y)
            onPositionChanged: mouse => root.screen.pressAndHoldChanged(mouse.y)
            onReleased: root.screen.pressAndHoldEnded()
            onCanceled: root.screen.pressAndHoldEnded()
        }
    }

    Item { // what is dragged
        anchors.fill: table
        clip: true
        QVDraggingView { screen: root.screen }
    }
    FrameAnimation {
        running: root.screen.moving
        onTriggered: root.screen.advanceFrame()
    }
    Shortcut {
        sequences: [StandardKey.Cancel]
        enabled: root.screen.dragging
        onActivated: root.screen.cancelReordering()
    }
    // Without the window there is no finger on it, and no frames.
    readonly property bool windowIsActive: Window.active
    onWindowIsActiveChanged: if (!windowIsActive) root.screen.finishReordering()
    Component.onDestruction: if (root.screen) root.screen.finishReordering()

    Flickable {
        id: emptyState
        anchors.fill: table
        visible: root.screen.showsEmptyState
        contentHeight: Math.max(height, importButton.y + importButton.height + 8)
        interactive: contentHeight > height
        boundsBehavior: Flickable.StopAtBounds
        readonly property real helpMargin: SystemStyle.largeText ? 10 : root.screen.emptyStateHelpMargin(width)
        readonly property real belowIcon: Math.max(47, 8 + emptyTitle.height) + 10 + help.height + 8 + importButton.height + 8
        Icon {
            id: icon
            anchors.horizontalCenter: parent.horizontalCenter
            // Above the middle; higher where what is beneath it needs the room.
            y: Math.max(8, Math.min(emptyState.height / 2, emptyState.height - emptyState.belowIcon) - height)
            width: 64
            height: 64
            name: "dashboard_glyph_emptydashboard"
        }
        Text {
            id: emptyTitle
            width: parent.width
            y: icon.y + icon.height + Math.max(8, 47 - height)
            text: root.screen.emptyStateTitle
            horizontalAlignment: Text.AlignHCenter
            font.pixelSize: SystemStyle.scaled(27)
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
            font.pixelSize: SystemStyle.scaled(18)
            color: SystemStyle.inactive
            Accessible.role: Accessible.StaticText
            Accessible.name: text
        }
        SystemButton {
            id: importButton
            anchors.top: help.bottom
            anchors.topMargin: 8
            anchors.horizontalCenter: parent.horizontalCenter
            width: Math.min(implicitWidth, parent.width)
            text: root.screen.importTitle
            onClicked: root.screen.importRequested()
            onActiveFocusChanged: if (activeFocus) emptyState.contentY = emptyState.contentHeight - emptyState.height
        }
    }
}
