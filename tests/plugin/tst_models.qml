import QtQuick 2.0
import QtTest 1.2
import Orbaline.Themelet 1.0
import ThemeletTesting 1.0

TestCase {
    id: test
    name: "Models"

    readonly property string nature: "file://" + Fixture.sandbox + "/sysroot/usr/share/themelet/nature/"

    RecordingService { id: service }

    Component { id: themelets; ThemeletModel {} }
    Component { id: photos; PhotoModel {} }
    Component { id: tones; ToneModel {} }

    function initTestCase() {
        verify(service.start())
    }

    function init() {
        service.clear()
    }

    function finished(component) {
        var model = createTemporaryObject(component, test)
        tryCompare(model, "status", ThemeletModel.Finished)
        return model
    }

    function column(model, role) {
        var values = []
        for (var i = 0; i < model.count; ++i)
            values.push(String(model.get(i)[role]))
        return values
    }

    function waitForCalls(count) {
        tryVerify(function() { return service.calls().length >= count })
        wait(50)
        compare(service.calls().length, count)
        return service.calls()
    }

    // Favourites first, each group by time.
    function test_themelets() {
        var model = finished(themelets)
        compare(column(model, "displayName"), ["Forest", "Aurora", "Ocean"])
        compare(column(model, "favorite"), ["true", "true", "false"])
        compare(column(model, "url")[1], nature + "aurora.themelet")
    }

    function test_filter_data() {
        return [
            { tag: "favourites", filter: ThemeletModel.FavoritesOnly, names: ["Forest", "Aurora"] },
            { tag: "others", filter: ThemeletModel.NonFavoritesOnly, names: ["Ocean"] },
            { tag: "none", filter: ThemeletModel.NoFilter, names: ["Forest", "Aurora", "Ocean"] }
        ]
    }

    // The filter works in a query, which runs after filterChanged.
    function test_filter(data) {
        var model = finished(themelets)
        var countAtSignal = -1
        model.filterChanged.connect(function() { countAtSignal = model.count })
        model.filter = ThemeletModel.FavoritesOnly
        model.filter = data.filter
        compare(countAtSignal, 3)
        tryCompare(model, "status", ThemeletModel.Finished)
        tryVerify(function() { return column(model, "displayName").join() === data.names.join() })
        compare(model.count, data.names.length)
    }

    function test_makeCurrent() {
        var model = finished(themelets)
        model.makeCurrent(-1)
        model.makeCurrent(model.count)
        model.makeCurrent(1)
        compare(waitForCalls(1), [{ method: "setThemelet", arguments: [nature + "aurora.themelet"] }])
    }

    // The name filter works on the rows at hand: no query runs, so the status never leaves
    // Finished. A filter set at creation holds back the first query's rows, and later ones.
    function test_photos() {
        var filtered = createTemporaryObject(photos, test, { nameFilter: "ab" })
        var model = finished(photos)
        tryCompare(filtered, "status", PhotoModel.Finished)
        compare(column(filtered, "fileName"), ["ab.jpg", "abc.jpg"])
        compare(column(model, "fileName"), ["b.jpg", "ab.jpg", "a.jpg", "abc.jpg"])

        var filterSignals = 0
        model.nameFilterChanged.connect(function() { ++filterSignals })
        var steps = [["a", ["ab.jpg", "a.jpg", "abc.jpg"]], ["ab", ["ab.jpg", "abc.jpg"]],
                     ["", ["b.jpg", "ab.jpg", "a.jpg", "abc.jpg"]]]
        for (var i = 0; i < steps.length; ++i) {
            model.nameFilter = steps[i][0]
            compare(model.status, PhotoModel.Finished, steps[i][0])
            compare(model.count, steps[i][1].length, steps[i][0])
            compare(column(model, "fileName"), steps[i][1], steps[i][0])
        }
        compare(filterSignals, 0) // declared, never emitted

        verify(Fixture.index(["photo", "abd.jpg"]))
        verify(service.emitContentChanged(2))
        tryCompare(filtered, "count", 3)
        compare(column(filtered, "fileName"), ["ab.jpg", "abc.jpg", "abd.jpg"])
        tryCompare(model, "count", 5)
        filtered.nameFilter = ""
        compare(filtered.count, 5)
    }

    // Ringtones, then the tones of customers, then the defaults, then the rest by display
    // name, where the themelet's tone, which has none, comes first.
    function test_tones() {
        var model = finished(tones)
        compare(column(model, "fileName"), ["ring.ogg", "custom.ogg", "alarm.ogg", "dusk.ogg", "beep.ogg"])
        compare(column(model, "category"), ["Ringtone", "Customer", "Default", "", "Other"])
    }

    function test_contentChanged_data() {
        return [
            { tag: "file", type: 0, queried: [1, 0, 1] },
            { tag: "themelet", type: 1, queried: [1, 0, 0] },
            { tag: "photo", type: 2, queried: [0, 1, 0] },
            { tag: "video", type: 3, queried: [0, 0, 0] },
            { tag: "download", type: 4, queried: [0, 0, 0] },
            { tag: "negative", type: -1, queried: [0, 0, 0] }
        ]
    }

    // Each model queries again only for its types; a query ends with one statusChanged.
    function test_contentChanged(data) {
        var models = [finished(themelets), finished(photos), finished(tones)]
        var spies = models.map(function(model) {
            return createTemporaryQmlObject("import QtTest 1.2; SignalSpy { signalName: 'statusChanged' }", test)
        })
        for (var i = 0; i < models.length; ++i)
            spies[i].target = models[i]
        verify(service.emitContentChanged(data.type))
        for (i = 0; i < models.length; ++i) {
            if (data.queried[i])
                tryCompare(spies[i], "count", 1)
        }
        wait(200)
        compare(spies.map(function(spy) { return spy.count }), data.queried)
        compare(models.map(function(model) { return model.status }), [2, 2, 2])
    }
}
