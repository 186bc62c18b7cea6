// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.0
import QtTest 1.2
import Orbaline.Themelet 1.0
import ThemeletTesting 1.0

TestCase {
    id: test
    name: "Profile"

    readonly property string profiles: "/org/orbaline/themelet/profiles/"

    Component { id: profileComponent; Profile {} }
    SignalSpy { id: volumeSpy; signalName: "ringerVolumeChanged" }
    SignalSpy { id: activeSpy; signalName: "activeProfileChanged" }

    function init() {
        Fixture.dconf(["reset", "-f", "/org/orbaline/themelet/"])
    }

    function created(properties) {
        var profile = createTemporaryObject(profileComponent, test, properties || {})
        ;[volumeSpy, activeSpy].forEach(function(spy) { spy.target = profile; spy.clear() })
        return profile
    }

    // Notices come in the order written: the change of the object's own profile marks
    // that the other profile's one before has arrived, unheard.
    function test_readsAnotherProcess() {
        Fixture.dconf(["write", profiles + "general/ringing.alert.tone", "'/sounds/ring.ogg'"])
        Fixture.dconf(["write", profiles + "general/sms.alert.enabled", "true"])
        var profile = created()
        compare([profile.profile, profile.ringerToneFile, profile.messageToneEnabled, profile.ringerVolume, volumeSpy.count],
                [Profile.General, "/sounds/ring.ogg", true, 0, 1])
        Fixture.dconf(["write", profiles + "silent/ringing.alert.volume", "30"])
        Fixture.dconf(["write", profiles + "general/ringing.alert.volume", "40"])
        tryCompare(profile, "ringerVolume", 40)
        compare(volumeSpy.count, 2)
    }

    function test_writesThrough() {
        var profile = created({ profile: Profile.Silent })
        profile.ringerToneFile = "/sounds/new.ogg"
        profile.ringerVolume = 20
        tryVerify(function() { return Fixture.dconf(["read", profiles + "silent/ringing.alert.tone"]) === "'/sounds/new.ogg'" })
        compare(Fixture.dconf(["read", profiles + "silent/ringing.alert.volume"]), "20")
        profile.clearTone(Profile.RingerTone)
        tryVerify(function() { return Fixture.dconf(["read", profiles + "silent/ringing.alert.tone"]) === "" })
    }

    function test_activeProfile() {
        var profile = created({ profile: Profile.Themelet, activateProfileOnChange: true })
        compare(Fixture.dconf(["read", "/org/orbaline/themelet/profile"]), "'themelet'")
        compare(profile.activeProfile, Profile.Themelet)
        tryCompare(activeSpy, "count", 1)
        profile.activeProfile = Profile.Silent
        tryCompare(activeSpy, "count", 2)
        compare([profile.activeProfile, profile.profile], [Profile.Silent, Profile.Themelet])
    }
}
