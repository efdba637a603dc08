import QtQuick

// In place of the application: what keeps it from starting, or what it waits for (then there is no button).
Rectangle {
    id: root
    property string title
    property string message
    property string buttonTitle
    color: SystemStyle.groupedBackground
    Column {
        anchors.centerIn: parent
        width: Math.min(parent.width - 48, 480)
        spacing: 16
        Text {
            width: parent.width
            text: root.title
            font.pixelSize: SystemStyle.scaled(20)
            font.bold: true
            color: SystemStyle.text
            horizontalAlignment: Text.AlignHCenter
            wrapMode: Text.WordWrap
            Accessible.role: Accessible.Heading
            Accessible.name: text
        }
        Text {
            width: parent.width
            text: root.message
            font.pixelSize: SystemStyle.bodySize
            color: SystemStyle.secondaryText
            horizontalAlignment: Text.AlignHCenter
            wrapMode: Text.Wrap
            Accessible.role: Accessible.StaticText
            Accessible.name: text
        }
        SystemButton {
            visible: root.buttonTitle !== ""
            anchors.horizontalCenter: parent.horizontalCenter
            filled: true
            focus: true
            text: root.buttonTitle
            onClicked: Qt.quit()
        }
    }
}
