// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

import QtQuick 2.0
import QtTest 1.2
import Orbaline.Themelet 1.0
import ThemeletTesting 1.0

TestCase {
    id: test
    name: "Models"

    Component { id: themelets; ThemeletModel {} }
    Component { id: photos; PhotoModel {} }
    Component { id: tones; ToneModel {} }

    function initTestCase() {
        verify(Fixture.startService())
    }

    function finished(component, properties) {
        var model = createTemporaryObject(component, test, properties || {})
        tryCompare(model, "status", ThemeletModel.Finished)
        return model
    }

    function column(model, role) {
        return Array.from({ length: model.count }, function(unused, i) { return String(model.get(i)[role]) }).join()
    }

    // Favourites first; the filter works in a query.
    function test_themelets() {
        var model = finished(themelets)
        compare(column(model, "displayName") + ";" + column(model, "favorite"), "Aurora,Ocean;true,false")
        model.filter = ThemeletModel.NonFavoritesOnly
        tryVerify(function() { return model.status === ThemeletModel.Finished && column(model, "displayName") === "Ocean" })
    }

    // The name filter works on the rows at hand: no query runs, so the status never leaves
    // Finished. A filter set at creation holds back the first query's rows.
    function test_photos() {
        compare(column(finished(photos, { nameFilter: "ab" }), "fileName"), "ab.jpg,abc.jpg")
        var model = finished(photos)
        var steps = [["a", "ab.jpg,a.jpg,abc.jpg"], ["ab", "ab.jpg,abc.jpg"], ["", "b.jpg,ab.jpg,a.jpg,abc.jpg"]]
        for (var i = 0; i < steps.length; ++i) {
            model.nameFilter = steps[i][0]
            compare([model.status, column(model, "fileName")], [PhotoModel.Finished, steps[i][1]], steps[i][0])
        }
    }

    // Ringtones, then the tones of customers, then the defaults, then the rest: the themelet's
    // tone, which has no category; the order within the rest is the index tests'.
    function test_tones() {
        compare(column(finished(tones), "fileName"), "ring.ogg,custom.ogg,alarm.ogg,dusk.ogg")
    }

    function test_contentChanged_data() {
        return [{ tag: "file", type: 0, queried: [1, 0, 1] }, { tag: "themelet", type: 1, queried: [1, 0, 0] },
                { tag: "photo", type: 2, queried: [0, 1, 0] }]
    }

    // Each model queries again only for its types; a query ends with one statusChanged.
    function test_contentChanged(data) {
        var models = [finished(themelets), finished(photos), finished(tones)]
        var counts = [0, 0, 0]
        models.forEach(function(model, i) { model.statusChanged.connect(function() { ++counts[i] }) })
        verify(Fixture.emitContentChanged(data.type))
        tryVerify(function() { return counts.join() === data.queried.join() })
        wait(200)
        compare([counts, models.map(function(model) { return model.status })], [data.queried, [2, 2, 2]])
    }
}
