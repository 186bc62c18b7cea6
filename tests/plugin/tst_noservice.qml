import QtQuick 2.0
import QtTest 1.2
import Orbaline.Themelet 1.0
import ThemeletTesting 1.0

// No themeletd on the bus: lists still come from the index, and writes go nowhere without a hang.
TestCase {
    id: test
    name: "NoService"

    readonly property string nature: "file://" + Fixture.sandbox + "/sysroot/usr/share/themelet/nature/"

    ThemeletModel { id: themelets }
    ContentInfo { id: info; contentType: ContentInfo.Themelet; property string displayName }

    function test_clientWithoutService() {
        tryCompare(themelets, "status", ThemeletModel.Finished)
        compare(themelets.count, 3)
        themelets.makeCurrent(0)
        themelets.setProperty(0, "displayName", "Renamed")
        compare(themelets.get(0).displayName, "Renamed")

        info.url = nature + "ocean.themelet"
        compare(info.displayName, "Ocean")
        info.displayName = "Sea"
        info.save()
        info.remove()
        compare(info.contentId, 0)

        var answered = false
        Themelet.create(nature + "new.themelet", function(id) { answered = true })
        wait(500) // the error reply comes at once and is only logged
        verify(!answered)
        compare(themelets.status, ThemeletModel.Finished)
    }
}
