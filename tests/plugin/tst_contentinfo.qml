// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.0
import QtTest 1.2
import Orbaline.Themelet 1.0
import ThemeletTesting 1.0

TestCase {
    id: test
    name: "ContentInfo"

    readonly property string nature: "file://" + Fixture.sandbox + "/sysroot/usr/share/themelet/nature/"

    Component {
        id: themeletInfo
        ContentInfo {
            contentType: ContentInfo.Themelet
            property string displayName
            property color highlightColor
            // A map-valued role, two levels deep.
            readonly property QtObject resources: QtObject {
                readonly property QtObject ringerToneFile: QtObject {
                    property url url
                    property string fileName
                }
            }
        }
    }

    SignalSpy { id: changedSpy; signalName: "changed" }
    SignalSpy { id: typeSpy; signalName: "contentTypeChanged" }

    function initTestCase() {
        verify(Fixture.startService())
    }

    function loaded(name) {
        return createTemporaryObject(themeletInfo, test, { url: nature + name + ".themelet" })
    }

    function test_loadSaveRemove() {
        var info = createTemporaryObject(themeletInfo, test)
        changedSpy.target = info
        info.url = nature + "aurora.themelet"
        compare(changedSpy.count, 1)
        compare([info.displayName, info.highlightColor], ["Aurora", "#ffcc66"])
        var tone = info.resources.ringerToneFile
        compare([tone.fileName, String(tone.url)], ["dusk.ogg", nature + "sounds/dusk.ogg"])
        // Not indexed: nothing loads, and no changed().
        info.url = nature + "none.themelet"
        compare([info.contentId, changedSpy.count], [0, 1])
        typeSpy.target = info
        info.contentType = ContentInfo.Photo
        info.contentType = ContentInfo.Photo
        compare(typeSpy.count, 1)

        // A load writes every bound property; none of that is a change to save. Of a nested
        // group only the changed leaf goes; the local values stay until the next load.
        info = loaded("ocean")
        info.contentId = loaded("aurora").contentId
        compare(info.url, nature + "aurora.themelet")
        info.save()
        info.resources.ringerToneFile.url = "file:///tones/new.ogg"
        info.highlightColor = "#80112233"
        info.save()
        compare(Fixture.takeCalls(1), [["saveAttributes", 1, info.contentId, {
            resources: { ringerToneFile: { url: "file:///tones/new.ogg" } }, highlightColor: "#80112233" }]])
        compare(String(info.resources.ringerToneFile.url), "file:///tones/new.ogg")
        // A change notice of the item's type loads again and drops what wasn't saved.
        info.displayName = "Dawn"
        verify(Fixture.emitContentChanged(1))
        tryCompare(info, "displayName", "Aurora")
        info.save()
        compare(Fixture.takeCalls(), [])

        var id = info.contentId
        info.remove()
        compare([info.contentId, info.url], [0, nature + "aurora.themelet"])
        compare(Fixture.takeCalls(1), [["remove", 1, id]])
    }
}
