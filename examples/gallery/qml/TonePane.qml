// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.15
import QtQuick.Controls 2.15
import QtQuick.Controls.Material 2.15
import QtQuick.Layouts 1.15
import Orbaline.Themelet 1.0

// A sound profile's volume and switches above the tones in category order;
// tapping a tone makes it the profile's ringer tone.
Item {
    id: pane

    property QtObject toneModel
    property QtObject profile

    // Profile's first read of the volume signals its change, which would make a
    // binding on it loop; the value is kept here instead.
    property int ringerVolume
    Component.onCompleted: ringerVolume = profile.ringerVolume
    Connections {
        target: pane.profile
        function onRingerVolumeChanged() { pane.ringerVolume = pane.profile.ringerVolume }
    }

    // Profile.profile values: Themelet 0, General 1, Silent 2.
    readonly property var profileNames: [qsTr("Themelet"), qsTr("General"), qsTr("Silent")]
    readonly property var switches: [
        { key: "ringerToneEnabled", name: qsTr("Ringer") },
        { key: "messageToneEnabled", name: qsTr("Messages") },
        { key: "chatToneEnabled", name: qsTr("Chat") },
        { key: "mailToneEnabled", name: qsTr("Mail") },
        { key: "internetCallToneEnabled", name: qsTr("Internet calls") },
        { key: "calendarToneEnabled", name: qsTr("Calendar") },
        { key: "clockAlarmToneEnabled", name: qsTr("Alarm") }
    ]

    ColumnLayout {
        anchors.fill: parent
        anchors.margins: 8
        spacing: 4

        Label {
            text: qsTr("Tones")
            font.pixelSize: 18
        }

        Frame {
            Layout.fillWidth: true
            padding: 8
            ColumnLayout {
                anchors.fill: parent
                spacing: 0
                RowLayout {
                    Layout.fillWidth: true
                    ComboBox {
                        model: pane.profileNames
                        currentIndex: pane.profile.profile
                        onActivated: pane.profile.profile = index
                        Layout.preferredWidth: 150
                    }
                    Label {
                        text: pane.profile.activeProfile === pane.profile.profile
                              ? qsTr("active profile")
                              : qsTr("active: %1").arg(pane.profileNames[pane.profile.activeProfile] || "?")
                        color: pane.profile.activeProfile === pane.profile.profile ? Material.accent : Material.foreground
                        Layout.fillWidth: true
                        elide: Text.ElideRight
                    }
                    Button {
                        text: qsTr("Activate")
                        flat: true
                        visible: pane.profile.activeProfile !== pane.profile.profile
                        onClicked: pane.profile.activeProfile = pane.profile.profile
                    }
                }
                RowLayout {
                    Layout.fillWidth: true
                    Label { text: qsTr("Volume") }
                    Slider {
                        from: 0
                        to: 100
                        stepSize: 1
                        value: pane.ringerVolume
                        onMoved: pane.profile.ringerVolume = value
                        Layout.fillWidth: true
                    }
                    Label {
                        text: pane.ringerVolume
                        Layout.preferredWidth: 28
                    }
                }
                Flow {
                    Layout.fillWidth: true
                    spacing: 0
                    Repeater {
                        model: pane.switches
                        delegate: Switch {
                            text: modelData.name
                            font.pixelSize: 13
                            checked: pane.profile[modelData.key]
                            onToggled: pane.profile[modelData.key] = checked
                        }
                    }
                }
            }
        }

        ListView {
            id: list
            Layout.fillWidth: true
            Layout.fillHeight: true
            clip: true
            model: pane.toneModel

            section.property: "category"
            section.delegate: Label {
                width: list.width
                topPadding: 10
                bottomPadding: 2
                leftPadding: 8
                text: section === "" ? qsTr("Themelet tones") : section
                font.pixelSize: 13
                font.bold: true
                color: Material.accent
            }

            delegate: ItemDelegate {
                width: list.width
                readonly property bool ringer: model.filePath === pane.profile.ringerToneFile
                contentItem: RowLayout {
                    spacing: 8
                    ColumnLayout {
                        spacing: 0
                        Layout.fillWidth: true
                        Label {
                            text: model.displayName || model.fileName
                            elide: Text.ElideRight
                            Layout.fillWidth: true
                        }
                        Label {
                            text: model.fileName + " · " + model.mimeType
                            font.pixelSize: 11
                            opacity: 0.6
                            elide: Text.ElideRight
                            Layout.fillWidth: true
                        }
                    }
                    Label {
                        visible: ringer
                        text: "♪ " + qsTr("Ringer")
                        color: Material.accent
                    }
                }
                onClicked: pane.profile.ringerToneFile = model.filePath
            }

            ScrollIndicator.vertical: ScrollIndicator { }
        }
    }
}
