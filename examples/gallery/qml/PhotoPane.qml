// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.15
import QtQuick.Controls 2.15
import QtQuick.Controls.Material 2.15
import QtQuick.Layouts 1.15
import Orbaline.Themelet 1.0

// The photos, filtered by the start of their names; the selected one can
// become a new themelet, which then appears in the themelet list by itself.
Item {
    id: pane

    property QtObject photoModel
    property string selectedUrl
    property string selectedName

    signal created(var contentId, string name)

    function choose(url, name) {
        selectedUrl = url
        selectedName = name
    }
    function createSelected() {
        var name = selectedName
        Themelet.create(selectedUrl, function (contentId) { pane.created(contentId, name) })
    }
    // Chooses a row and makes a themelet of it, as the button does; for the test mode.
    function createFrom(index) {
        var row = photoModel.get(index)
        choose(String(row.url), row.fileName)
        createSelected()
        return row.fileName
    }

    ColumnLayout {
        anchors.fill: parent
        anchors.margins: 8
        spacing: 4

        RowLayout {
            Layout.fillWidth: true
            Label {
                text: qsTr("Photos")
                font.pixelSize: 18
            }
            TextField {
                placeholderText: qsTr("Name starts with…")
                onTextChanged: pane.photoModel.nameFilter = text
                Layout.fillWidth: true
                selectByMouse: true
            }
        }

        GridView {
            id: grid
            Layout.fillWidth: true
            Layout.fillHeight: true
            clip: true
            model: pane.photoModel

            readonly property int columns: Math.max(3, Math.floor(width / 130))
            cellWidth: width / columns
            cellHeight: cellWidth

            delegate: Item {
                width: grid.cellWidth
                height: grid.cellHeight
                readonly property bool selected: String(model.url) === pane.selectedUrl

                Image {
                    anchors.fill: parent
                    anchors.margins: 3
                    source: model.url
                    sourceSize.width: 240
                    autoTransform: true
                    fillMode: Image.PreserveAspectCrop
                    asynchronous: true
                    clip: true
                }
                Rectangle {
                    anchors.fill: parent
                    anchors.margins: 3
                    color: "transparent"
                    border.width: parent.selected ? 3 : 0
                    border.color: Material.accent
                }
                Label {
                    anchors { left: parent.left; right: parent.right; bottom: parent.bottom; margins: 3 }
                    padding: 3
                    // Date and orientation come from the picture's metadata.
                    text: model.fileName + "\n" + Qt.formatDate(model.dateTaken, "d MMM yyyy")
                          + (model.orientation > 1 ? " · ⟳" + model.orientation : "")
                    font.pixelSize: 11
                    lineHeight: 0.9
                    elide: Text.ElideRight
                    background: Rectangle { color: "#99000000" }
                }
                MouseArea {
                    anchors.fill: parent
                    onClicked: pane.choose(String(model.url), model.fileName)
                }
            }

            ScrollIndicator.vertical: ScrollIndicator { }
        }

        RowLayout {
            Layout.fillWidth: true
            Label {
                text: pane.selectedUrl === "" ? qsTr("Tap a photo to choose it") : pane.selectedName
                elide: Text.ElideMiddle
                Layout.fillWidth: true
            }
            Button {
                text: qsTr("Create themelet")
                highlighted: true
                enabled: pane.selectedUrl !== ""
                onClicked: pane.createSelected()
            }
        }
    }
}
