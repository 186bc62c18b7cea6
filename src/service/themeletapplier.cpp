#include "themeletapplier.h"

#include "dconfstore.h"
#include "profile.h"
#include "themeletcolor.h"
#include "themelettones.h"

#include <QDebug>

const char *const ThemeletApplier::ProfileName = "themelet";

QStringList ThemeletApplier::colorKeys()
{
    return {
        QStringLiteral("/desktop/vorka/themelet/highlight_color"),
        QStringLiteral("/desktop/vorka/themelet/secondary_highlight_color"),
        QStringLiteral("/desktop/vorka/themelet/primary_color"),
        QStringLiteral("/desktop/vorka/themelet/secondary_color"),
    };
}

QStringList ThemeletApplier::toneKeys()
{
    // The fallback profile names the system's tones by the same keys.
    return ThemeletTones::fallbackProfileKeys();
}

QStringList ThemeletApplier::switchKeys()
{
    return toneKeys().replaceInStrings(QStringLiteral(".tone"), QStringLiteral(".enabled"));
}

const char *ThemeletApplier::volumeKey()
{
    return "ringing.alert.volume";
}

bool ThemeletApplier::apply(const Themelet &themelet)
{
    if (themelet.isNull())
        return false;
    bool ok = profile_set_value_as_int(ProfileName, volumeKey(), themelet->ringerVolume) == 0;

    const QStringList tones = ThemeletTones::keys(), profileTones = toneKeys(), switches = switchKeys();
    for (int i = 0; i < ThemeletTones::Count; ++i) {
        const QUrl url = themelet->resources.value(tones.at(i) + QLatin1String("File")).toMap()
                                 .value(QStringLiteral("url")).toUrl();
        const QByteArray path = url.isLocalFile() ? url.toLocalFile().toUtf8() : QByteArray();
        ok &= profile_set_value(ProfileName, profileTones.at(i).toUtf8().constData(), path.constData()) == 0;
        const bool enabled = themelet->enabledSounds & (1 << i);
        ok &= profile_set_value_as_bool(ProfileName, switches.at(i).toUtf8().constData(), enabled) == 0;
    }

    const QColor colors[] = { themelet->highlightColor, themelet->secondaryHighlightColor,
                              themelet->primaryColor, themelet->secondaryColor };
    const QStringList keys = colorKeys();
    DConfStore *store = DConfStore::instance();
    for (int i = 0; i < keys.size(); ++i) {
        const QVariant value = colors[i].isValid() ? QVariant(colorToString(colors[i])) : QVariant();
        ok &= store && store->write(keys.at(i), value);
    }
    if (!ok)
        qWarning() << "Applying themelet" << themelet->url.toLocalFile() << "failed in part";
    return ok;
}
