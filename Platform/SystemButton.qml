import QtQuick
import QtQuick.Templates as T

// A button of tinted text.
T.Button {
    id: button
    property bool filled: false
    property bool emphasized: false
    implicitHeight: SystemStyle.touchHeight
    implicitWidth: label.implicitWidth + (filled ? 40 : 16)
    focusPolicy: Qt.StrongFocus
    Accessible.name: text
    Accessible.onPressAction: button.clicked()
    Keys.onReturnPressed: button.clicked()
    Keys.onEnterPressed: button.clicked()
    contentItem: Text {
        id: label
        text: button.text
        color: button.filled ? "white" : SystemStyle.tint
        opacity: button.enabled ? (button.down && !button.filled ? 0.3 : 1) : 0.4
        font.pixelSize: SystemStyle.bodySize
        font.bold: button.emphasized
        fontSizeMode: SystemStyle.largeText ? Text.HorizontalFit : Text.FixedSize
        minimumPixelSize: 13
        horizontalAlignment: Text.AlignHCenter
        verticalAlignment: Text.AlignVCenter
        elide: Text.ElideRight
    }
    background: Rectangle {
        visible: button.filled
        radius: 8
        color: button.down ? Qt.darker(SystemStyle.tint, 1.2) : SystemStyle.tint
    }
    FocusRing { shown: button.visualFocus; gap: button.filled ? 3 : 0 }
}
