import QtQuick

// Shows where the keyboard is.
Rectangle {
    property bool shown: false
    property real gap: 0
    anchors.fill: parent
    anchors.margins: -gap
    visible: shown
    color: "transparent"
    radius: 6
    border.width: 2
    border.color: SystemStyle.tint
    z: 10
    Rectangle { // seen on every ground
        anchors.fill: parent
        anchors.margins: 2
        color: "transparent"
        radius: 4
        border.width: 1
        border.color: "white"
    }
}
