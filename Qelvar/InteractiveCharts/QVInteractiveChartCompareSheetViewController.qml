import QtQuick
import QtQuick.Templates as T
import Qelvar.Items

FocusScope {
    id: root
    property var screen: null
    // As if each name stood on one line: how high the rows are is known only when they are shown.
    implicitHeight: header.height + (table.count > 0 ? table.count * SystemStyle.touchHeight : empty.implicitHeight)

    // Enter on a row is done; on a button it is the button's.
    Keys.onReturnPressed: screen.tapDone()
    Keys.onEnterPressed: screen.tapDone()
    Keys.onEscapePressed: screen.cancel()
    Keys.onPressed: event => {
        if (event.key !== Qt.Key_Back) return
        screen.cancel()
        event.accepted = true
    }

    Item {
        id: header
        // The title goes above the buttons when it does not fit between them in the middle.
        readonly property bool isTall: title.implicitWidth + 2 * Math.max(selectAll.width, done.width) + 32 > width
        width: parent.width
        height: selectAll.y + selectAll.height + (limit.visible ? limit.height : 0)
        Text {
            id: title
            anchors.horizontalCenter: parent.horizontalCenter
            y: header.isTall ? 12 : (selectAll.height - height) / 2
            width: Math.min(implicitWidth, parent.width - 32)
            fontSizeMode: SystemStyle.largeText ? Text.HorizontalFit : Text.FixedSize
            minimumPixelSize: 17
            text: root.screen.title
            color: SystemStyle.text
            font.pixelSize: SystemStyle.bodySize
            font.bold: true
            horizontalAlignment: Text.AlignHCenter
            elide: Text.ElideRight
            Accessible.role: Accessible.Heading
            Accessible.name: text
        }
        SystemButton {
            id: selectAll
            anchors.left: parent.left
            anchors.leftMargin: 8
            y: header.isTall ? title.y + title.height : 0
            width: Math.min(implicitWidth, header.width - 2 * 8 - done.width)
            enabled: root.screen.canSelectAll
            text: root.screen.selectAllTitle
            onClicked: root.screen.tapSelectAll()
        }
        SystemButton {
            id: done
            anchors.right: parent.right
            anchors.rightMargin: 8
            y: selectAll.y
            width: Math.min(implicitWidth, (header.width - 2 * 8) / 2)
            emphasized: true
            focus: !root.screen.canSelectAll
            text: root.screen.doneTitle
            onClicked: root.screen.tapDone()
        }
        Text {
            id: limit
            anchors.top: selectAll.bottom
            width: parent.width
            visible: text.length > 0
            leftPadding: 16
            rightPadding: 16
            bottomPadding: 10
            text: root.screen.limitText
            color: SystemStyle.secondaryText
            font.pixelSize: SystemStyle.captionSize
            horizontalAlignment: Text.AlignHCenter
            wrapMode: Text.Wrap
            Accessible.role: Accessible.StaticText
            Accessible.name: text
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
        anchors { left: parent.left; right: parent.right; top: header.bottom; bottom: parent.bottom }
        clip: true
        focus: root.screen.canSelectAll
        activeFocusOnTab: count > 0
        keyNavigationEnabled: true
        highlightFollowsCurrentItem: false
        boundsBehavior: Flickable.StopAtBounds
        model: root.screen.table
        Accessible.role: Accessible.List
        Accessible.name: root.screen.title
        property bool byKeyboard: false
        function go(row) { currentIndex = Math.max(0, Math.min(count - 1, row)) }
        Keys.onPressed: event => {
            byKeyboard = true
            const page = Math.max(1, Math.floor(height / Math.max(1, contentHeight / Math.max(1, count))) - 1)
            event.accepted = true
            switch (event.key) {
            case Qt.Key_Home: go(0); break
            case Qt.Key_End: go(count - 1); break
            case Qt.Key_PageUp: go(currentIndex - page); break
            case Qt.Key_PageDown: go(currentIndex + page); break
            default: event.accepted = false
            }
        }
        onCurrentIndexChanged: if (byKeyboard) positionViewAtIndex(currentIndex, ListView.Contain)

        delegate: T.CheckBox {
            id: row
            required property int index
            required property string displayName
            required property bool selected
            required property bool canToggle
            required property string categoryIcon
            width: ListView.view ? ListView.view.width : 0
            height: Math.max(SystemStyle.touchHeight, label.implicitHeight + 2 * 8)
            focusPolicy: Qt.ClickFocus // the Tab key stops once at the list
            text: displayName
            // The screen says what is ticked, also when a tap changes nothing.
            checkState: selected ? Qt.Checked : Qt.Unchecked
            nextCheckState: () => checkState
            onPressed: table.byKeyboard = false
            onClicked: root.screen.tapRow(index)
            onActiveFocusChanged: if (activeFocus) ListView.view.currentIndex = index
            onVisualFocusChanged: if (visualFocus) table.positionViewAtIndex(index, ListView.Contain)
            Accessible.name: text
            Accessible.description: canToggle ? "" : root.screen.limitText
            background: Rectangle {
                color: row.down && row.canToggle ? SystemStyle.emphasis : "transparent"
                Rectangle {
                    visible: row.index < table.count - 1
                    anchors { left: parent.left; leftMargin: 54; right: parent.right; bottom: parent.bottom }
                    height: SystemStyle.pixel
                    color: SystemStyle.hairline
                }
            }
            contentItem: Item {
                opacity: row.canToggle ? 1 : 0.4
                TextMetrics { // of the longest word: larger texts shrink before one is broken
                    id: longestWord
                    font.pixelSize: SystemStyle.bodySize
                    text: row.text.split(" ").reduce((longest, word) => word.length > longest.length ? word : longest, "")
                }
                Icon {
                    id: mark
                    anchors { left: parent.left; leftMargin: 16; verticalCenter: parent.verticalCenter }
                    width: 24
                    height: 24
                    name: row.categoryIcon
                }
                Text {
                    id: label
                    anchors { left: mark.right; leftMargin: 14; right: box.left; rightMargin: 12; verticalCenter: parent.verticalCenter }
                    text: row.text
                    color: SystemStyle.text
                    font.pixelSize: SystemStyle.largeText ? Math.max(17, Math.floor(SystemStyle.bodySize * Math.min(1, width / (longestWord.advanceWidth + 1)))) : SystemStyle.bodySize
                    horizontalAlignment: Text.AlignLeft
                    wrapMode: Text.Wrap
                    maximumLineCount: SystemStyle.largeText ? 6 : 3
                    elide: Text.ElideRight
                }
                Rectangle {
                    id: box
                    anchors { right: parent.right; rightMargin: 16; verticalCenter: parent.verticalCenter }
                    width: 24
                    height: 24
                    radius: 12
                    color: row.selected ? SystemStyle.tint : "transparent"
                    border.width: row.selected ? 0 : 1.5
                    border.color: SystemStyle.inactive
                    Icon {
                        anchors.centerIn: parent
                        visible: row.selected
                        width: 14
                        height: 14
                        name: "checkmark"
                        tint: "white"
                    }
                }
            }
            FocusRing { anchors.margins: 2; shown: row.visualFocus || (row.activeFocus && table.byKeyboard) }
        }
    }

    Text {
        id: empty
        anchors { left: parent.left; right: parent.right; top: header.bottom }
        visible: table.count === 0
        padding: 32
        text: root.screen.emptyText
        color: SystemStyle.secondaryText
        font.pixelSize: SystemStyle.bodySize
        horizontalAlignment: Text.AlignHCenter
        wrapMode: Text.Wrap
        Accessible.role: Accessible.StaticText
        Accessible.name: text
    }
}
