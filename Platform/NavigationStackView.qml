import QtQuick
import QtQuick.Templates as T

// A navigation bar, and the screens of a stack sliding over each other beneath it.
FocusScope {
    id: root
    property var stack: null
    readonly property bool busy: screens.busy
    readonly property int slide: mirrored ? -width : width
    property bool mirrored: false

    Rectangle {
        id: bar
        width: parent.width
        height: SystemStyle.navigationBarHeight
        color: SystemStyle.bar
        z: 2

        T.Button {
            id: back
            visible: root.stack ? root.stack.canGoBack : false
            anchors.left: parent.left
            height: parent.height
            // A large title that would be cut leaves the chevron alone.
            readonly property bool onlyChevron: SystemStyle.largeText && backText.implicitWidth + 36 > parent.width / 3
            width: onlyChevron ? 44 : Math.min(backText.implicitWidth + 36, parent.width / 3)
            text: root.stack ? root.stack.backTitle : ""
            onClicked: root.stack.pop()
            Accessible.name: text
            Keys.onReturnPressed: back.clicked()
            Keys.onEnterPressed: back.clicked()
            contentItem: Item {
                opacity: back.down ? 0.3 : 1
                Item { // a chevron
                    id: chevron
                    anchors { left: parent.left; leftMargin: 8; verticalCenter: parent.verticalCenter }
                    width: 12
                    height: 20
                    scale: root.mirrored ? -1 : 1
                    Rectangle { x: 0; y: 5.5; width: 13; height: 2; radius: 1; rotation: -45; color: SystemStyle.tint }
                    Rectangle { x: 0; y: 13; width: 13; height: 2; radius: 1; rotation: 45; color: SystemStyle.tint }
                }
                Text {
                    id: backText
                    anchors { left: chevron.right; leftMargin: 6; right: parent.right; rightMargin: 4; verticalCenter: parent.verticalCenter }
                    visible: !back.onlyChevron
                    text: back.text
                    color: SystemStyle.tint
                    font.pixelSize: SystemStyle.bodySize
                    elide: Text.ElideRight
                }
            }
            FocusRing { anchors.margins: 2; shown: back.visualFocus }
        }

        Text {
            id: title
            anchors.centerIn: parent
            width: Math.min(implicitWidth, parent.width - 2 * (back.visible ? Math.max(back.width, 44) + 8 : 12))
            text: root.stack ? root.stack.topScreen.title : ""
            color: SystemStyle.text
            font.pixelSize: SystemStyle.bodySize
            font.bold: true
            fontSizeMode: SystemStyle.largeText ? Text.HorizontalFit : Text.FixedSize
            minimumPixelSize: 17
            elide: Text.ElideRight
            Accessible.role: Accessible.Heading
            Accessible.name: text
        }

        Rectangle {
            // A screen with a palette draws the line beneath that.
            visible: !(screens.currentItem && screens.currentItem.hasPalette === true)
            anchors.bottom: parent.bottom
            width: parent.width
            height: SystemStyle.pixel
            color: SystemStyle.hairline
        }
    }

    T.StackView {
        id: screens
        anchors.fill: parent
        anchors.topMargin: bar.height
        clip: busy
        focus: true
        readonly property int duration: 250
        pushEnter: Transition { NumberAnimation { property: "x"; from: root.slide; to: 0; duration: screens.duration; easing.type: Easing.OutCubic } }
        pushExit: Transition { NumberAnimation { property: "x"; from: 0; to: -root.slide / 3; duration: screens.duration; easing.type: Easing.OutCubic } }
        popEnter: Transition { NumberAnimation { property: "x"; from: -root.slide / 3; to: 0; duration: screens.duration; easing.type: Easing.OutCubic } }
        popExit: Transition { NumberAnimation { property: "x"; from: 0; to: root.slide; duration: screens.duration; easing.type: Easing.OutCubic } }
        // Later: what slid out is destroyed when control returns to the event loop, and before its screen.
        onBusyChanged: if (!busy && root.stack) Qt.callLater(root.stack.transitionFinished)

        function show(screen, animated) {
            push(screen.view, { screen: screen }, animated && SystemStyle.animated ? T.StackView.PushTransition : T.StackView.Immediate)
        }
    }

    Connections {
        target: root.stack
        function onPushed(screen, animated) {
            screens.show(screen, animated && root.visible)
            screens.currentItem.forceActiveFocus()
        }
        function onPopped(count, animated) {
            screens.pop(screens.get(screens.depth - 1 - count), animated && root.visible && SystemStyle.animated ? T.StackView.PopTransition : T.StackView.Immediate)
            screens.currentItem.forceActiveFocus()
        }
    }

    // A stack may be deep already when it is first laid out.
    Component.onCompleted: {
        for (let i = 0; i < stack.count(); ++i) screens.show(stack.screenAt(i), false)
    }

    Keys.onPressed: event => {
        const backKey = root.mirrored ? Qt.Key_Right : Qt.Key_Left
        if (event.key === Qt.Key_Back || event.key === Qt.Key_Escape ||
                (event.key === backKey && (event.modifiers & Qt.AltModifier))) {
            if (root.stack.canGoBack) {
                root.stack.pop()
                event.accepted = true
            }
        }
    }
}
