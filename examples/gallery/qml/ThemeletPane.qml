// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.15
import QtQuick.Controls 2.15
import QtQuick.Controls.Material 2.15
import QtQuick.Layouts 1.15
import Orbaline.Themelet 1.0

// The themelets as wallpaper cards: tap one to make it current, the star
// toggles the favourite mark, the current one is framed.
Item {
    id: pane

    property QtObject themeletModel

    // Window coordinates of a card's wallpaper, for the test mode.
    function tapPoint(index) {
        grid.positionViewAtIndex(index, GridView.Contain)
        var card = grid.itemAtIndex(index)
        return card ? card.mapToItem(null, card.width / 2, card.height / 3) : Qt.point(0, 0)
    }

    ColumnLayout {
        anchors.fill: parent
        anchors.margins: 8
        spacing: 4

        RowLayout {
            Layout.fillWidth: true
            Label {
                text: qsTr("Themelets")
                font.pixelSize: 18
                Layout.fillWidth: true
            }
            ComboBox {
                // ThemeletModel.filter: NoFilter, FavoritesOnly, NonFavoritesOnly.
                model: [qsTr("All"), qsTr("Favourites"), qsTr("Others")]
                currentIndex: pane.themeletModel.filter
                onActivated: pane.themeletModel.filter = index
                Layout.preferredWidth: 150
            }
        }

        GridView {
            id: grid
            Layout.fillWidth: true
            Layout.fillHeight: true
            clip: true
            model: pane.themeletModel

            readonly property int columns: Math.max(2, Math.floor(width / 180))
            cellWidth: width / columns
            cellHeight: cellWidth * 1.45 + 44

            delegate: Item {
                id: card
                width: grid.cellWidth
                height: grid.cellHeight

                readonly property bool current: String(model.url) === String(Themelet.source)

                Rectangle {
                    id: frame
                    anchors.fill: parent
                    anchors.margins: 6
                    radius: 10
                    color: "#252f35"
                    border.width: card.current ? 3 : 1
                    border.color: card.current ? Material.accent : "#37474f"

                    Image {
                        id: thumb
                        anchors { left: parent.left; right: parent.right; top: parent.top; margins: 4 }
                        height: width * 1.4
                        source: model.wallpaperUrl
                        sourceSize.width: 320
                        fillMode: Image.PreserveAspectCrop
                        asynchronous: true
                        clip: true

                        MouseArea {
                            anchors.fill: parent
                            onClicked: pane.themeletModel.makeCurrent(index)
                        }

                        Rectangle {
                            visible: card.current
                            anchors { left: parent.left; top: parent.top; margins: 6 }
                            radius: 4
                            color: Material.accent
                            width: currentLabel.implicitWidth + 12
                            height: currentLabel.implicitHeight + 4
                            Label {
                                id: currentLabel
                                anchors.centerIn: parent
                                text: "✓ " + qsTr("Current")
                                font.pixelSize: 12
                                font.bold: true
                                color: "#102027"
                            }
                        }

                        RoundButton {
                            anchors { right: parent.right; top: parent.top; margins: 2 }
                            width: 40
                            height: 40
                            flat: true
                            text: model.favorite ? "★" : "☆"
                            font.pixelSize: 20
                            Material.foreground: model.favorite ? "#ffd54f" : "#eceff1"
                            onClicked: pane.themeletModel.setProperty(index, "favorite", !model.favorite)
                        }
                    }

                    RowLayout {
                        anchors { left: parent.left; right: parent.right; top: thumb.bottom; bottom: parent.bottom; margins: 6 }
                        spacing: 4
                        Label {
                            text: model.displayName || model.fileName
                            elide: Text.ElideRight
                            font.pixelSize: 14
                            Layout.fillWidth: true
                        }
                        Repeater {
                            model: [card.colorOf("highlightColor"), card.colorOf("secondaryHighlightColor"),
                                    card.colorOf("primaryColor"), card.colorOf("secondaryColor")]
                            delegate: Rectangle {
                                width: 10
                                height: 10
                                radius: 5
                                color: modelData
                                border.color: "#90a4ae"
                                border.width: 1
                            }
                        }
                    }
                }

                function colorOf(role) {
                    var c = model[role]
                    return c && c.valid !== false ? c : "transparent"
                }
            }

            ScrollIndicator.vertical: ScrollIndicator { }
        }
    }
}
