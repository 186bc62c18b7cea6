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
    SignalSpy { id: activeSpy; signalName: "activeProfileChanged" }

    // Reads and notices of values that another process writes are tst_profilemanager's.
    function test_writesThrough() {
        var silent = createTemporaryObject(profileComponent, test, { profile: Profile.Silent })
        silent.ringerToneFile = "/sounds/new.ogg"
        silent.ringerVolume = 20
        tryVerify(function() { return Fixture.dconf(["read", profiles + "silent/ringing.alert.tone"]) === "'/sounds/new.ogg'" })
        compare(Fixture.dconf(["read", profiles + "silent/ringing.alert.volume"]), "20")
        silent.clearTone(Profile.RingerTone)
        tryVerify(function() { return Fixture.dconf(["read", profiles + "silent/ringing.alert.tone"]) === "" })

        var profile = createTemporaryObject(profileComponent, test, { profile: Profile.Themelet, activateProfileOnChange: true })
        activeSpy.target = profile
        compare(Fixture.dconf(["read", "/org/orbaline/themelet/profile"]), "'themelet'")
        compare(profile.activeProfile, Profile.Themelet)
        tryCompare(activeSpy, "count", 1)
        profile.activeProfile = Profile.Silent
        tryCompare(activeSpy, "count", 2)
        compare([profile.activeProfile, profile.profile], [Profile.Silent, Profile.Themelet])
    }
}
