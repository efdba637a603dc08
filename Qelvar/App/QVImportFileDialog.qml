import QtQuick.Dialogs

// Loaded when it is first needed.
FileDialog {
    property string filterName: ""
    fileMode: FileDialog.OpenFiles
    nameFilters: [filterName + " (*.xml *.zip *.XML *.ZIP)"]
}
