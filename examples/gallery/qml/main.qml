// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.15
import QtQuick.Window 2.15
import QtQuick.Controls 2.15
import QtQuick.Controls.Material 2.15
import QtQuick.Layouts 1.15
import Orbaline.Themelet 1.0

ApplicationWindow {
    id: window

    title: qsTr("Themelet gallery")
    width: 1280
    height: 800

    // Three columns side by side when there is room, tabs on a phone.
    readonly property bool wide: width >= 960
    readonly property var statusNames: ["Null", "Querying", "Finished", "Error"]

    // For the screenshot and test mode of main.cpp.
    readonly property QtObject themeletModel: themelets
    readonly property QtObject photoModel: photos
    readonly property QtObject toneModel: tones
    readonly property string activeSource: String(Themelet.source)

    property string message

    // The themelet made last. contentId is a 64-bit id, for which QML 5.15 has no
    // literal: "contentId: 39" is refused, "contentId: 39 + 0" or a script
    // assignment works (docs/qml.md).
    ContentInfo {
        id: createdThemelet
        contentType: ContentInfo.Themelet
        property string displayName
    }

    function statusName(status) { return statusNames[status] || "Unknown" }
    function inactiveThemelet() {
        for (var i = 0; i < themelets.count; ++i) {
            if (String(themelets.get(i).url) !== activeSource)
                return i
        }
        return -1
    }
    function themeletUrl(index) { return String(themelets.get(index).url) }
    function themeletTapPoint(index) { return themeletPane.tapPoint(index) }
    function createFromPhoto(index) { return photoPane.createFrom(index) }
    // Flips the mail tone and makes the first ringtone that isn't the ringer tone
    // the new one, as a user would with the switches and the list.
    function switchProfileSounds() {
        profile.mailToneEnabled = !profile.mailToneEnabled
        for (var i = 0; i < tones.count; ++i) {
            var tone = tones.get(i)
            if (tone.filePath !== profile.ringerToneFile) {
                profile.ringerToneFile = tone.filePath
                break
            }
        }
        return "switched: mail tone " + (profile.mailToneEnabled ? "on" : "off") + ", ringer tone " + profile.ringerToneFile
    }

    function activeName() {
        for (var i = 0; i < themelets.count; ++i) {
            var row = themelets.get(i)
            if (String(row.url) === activeSource)
                return row.displayName || row.fileName
        }
        return activeSource === "" ? qsTr("none") : activeSource.replace(/.*\//, "")
    }

    ThemeletModel { id: themelets }
    PhotoModel { id: photos }
    ToneModel { id: tones }
    Profile { id: profile }

    Timer { id: messageTimer; interval: 6000; onTriggered: window.message = "" }
    onMessageChanged: if (message !== "") messageTimer.restart()

    header: ToolBar {
        Material.background: "#1c262b"
        ColumnLayout {
            anchors.fill: parent
            spacing: 0
            RowLayout {
                Layout.fillWidth: true
                Layout.leftMargin: 16
                Layout.rightMargin: 16
                Layout.preferredHeight: 48
                Label {
                    text: window.title
                    font.pixelSize: 20
                    font.bold: true
                }
                Item { Layout.fillWidth: true }
                Label {
                    // Re-evaluated when the source or the rows change.
                    text: qsTr("Current: %1").arg(themelets.count >= 0 ? window.activeName() : "")
                    color: Material.accent
                    elide: Text.ElideMiddle
                    Layout.maximumWidth: window.width * 0.5
                }
            }
            TabBar {
                id: tabs
                visible: !window.wide
                Layout.fillWidth: true
                Material.background: "transparent"
                TabButton { text: qsTr("Themelets") }
                TabButton { text: qsTr("Photos") }
                TabButton { text: qsTr("Tones") }
            }
        }
    }

    Item {
        id: panes
        anchors.fill: parent

        // Shares of the width in the wide layout.
        readonly property var shares: [0.36, 0.34, 0.30]
        function paneX(i) {
            if (!window.wide)
                return 0
            var x = 0
            for (var j = 0; j < i; ++j)
                x += shares[j] * width
            return x
        }
        function paneWidth(i) { return window.wide ? shares[i] * width : width }
        function paneVisible(i) { return window.wide || tabs.currentIndex === i }

        ThemeletPane {
            id: themeletPane
            x: panes.paneX(0); width: panes.paneWidth(0); height: panes.height
            visible: panes.paneVisible(0)
            themeletModel: themelets
        }
        PhotoPane {
            id: photoPane
            x: panes.paneX(1); width: panes.paneWidth(1); height: panes.height
            visible: panes.paneVisible(1)
            photoModel: photos
            onCreated: {
                createdThemelet.contentId = contentId
                window.message = qsTr("Created themelet %1 from %2").arg(createdThemelet.displayName || contentId).arg(name)
            }
        }
        TonePane {
            x: panes.paneX(2); width: panes.paneWidth(2); height: panes.height
            visible: panes.paneVisible(2)
            toneModel: tones
            profile: profile
        }
    }

    footer: ToolBar {
        Material.background: "#1c262b"
        height: statusRow.implicitHeight + 12
        Flow {
            id: statusRow
            anchors.fill: parent
            anchors.margins: 6
            anchors.leftMargin: 16
            spacing: 18
            Repeater {
                model: [
                    { name: qsTr("Themelets"), list: themelets },
                    { name: qsTr("Photos"), list: photos },
                    { name: qsTr("Tones"), list: tones }
                ]
                delegate: Row {
                    spacing: 6
                    StatusDot { status: modelData.list.status; anchors.verticalCenter: parent.verticalCenter }
                    Label {
                        text: "%1: %2 · %3".arg(modelData.name).arg(window.statusName(modelData.list.status)).arg(modelData.list.count)
                        font.pixelSize: 13
                    }
                }
            }
            Label {
                visible: window.message !== ""
                text: window.message
                color: Material.accent
                font.pixelSize: 13
            }
        }
    }
}
