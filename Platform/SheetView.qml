import QtQuick

// Shows the screen of a presentation as a sheet.
SystemSheet {
    id: sheet
    property var presentation: null
    readonly property var presented: presentation ? presentation.screen : null
    readonly property bool animated: presentation && SystemStyle.animated ? presentation.animated : false
    title: presented ? presented.title : ""
    implicitHeight: loader.item ? loader.item.implicitHeight : 0
    enter: Transition {
        enabled: sheet.animated
        NumberAnimation { property: "opacity"; from: 0; to: 1; duration: 200 }
    }
    exit: Transition {
        enabled: sheet.animated
        NumberAnimation { property: "opacity"; from: 1; to: 0; duration: 200 }
    }
    function follow() {
        if (presented) {
            opacity = 1
            loader.setSource(presented.view, { screen: presented })
            open()
        } else {
            close()
        }
    }
    onPresentedChanged: follow()
    Component.onCompleted: if (presented) follow()
    onOpened: loader.item.forceActiveFocus()
    onClosed: {
        loader.source = ""
        presentation.transitionFinished()
    }

    Loader {
        id: loader
        anchors.fill: parent
        focus: true
    }
}
