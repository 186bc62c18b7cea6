// SPDX-FileCopyrightText: 2026 The themelet authors
// SPDX-License-Identifier: LGPL-2.1-or-later

#include "controltool.h"

#include "changemonitor.h"
#include "packagechecker.h"
#include "themeletinterface.h"
#include "themeletsettings.h"

#include <QCommandLineParser>
#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QJsonArray>
#include <QRegularExpression>

struct ControlTool::Command
{
    const char *name;
    const char *synopsis;
    int argumentCount;
    const char *summary;
    int (ControlTool::*handler)(const QStringList &);
};

const ControlTool::Command ControlTool::s_commands[] = {
    { "list", "themelets|photos|tones", 1, "list the index", &ControlTool::list },
    { "show", "ID|URL", 1, "one indexed item with all its fields", &ControlTool::show },
    { "set", "ID|URL", 1, "make a themelet the active one", &ControlTool::set },
    { "create", "PICTURE", 1, "create a themelet from a picture", &ControlTool::create },
    { "favorite", "ID|URL on|off", 2, "mark or unmark a favourite themelet", &ControlTool::favorite },
    { "install", "DIR", 1, "install the package in a directory", &ControlTool::install },
    { "index", "FILE", 1, "have one file indexed", &ControlTool::index },
    { "refresh", "", 0, "rescan the installed themelets", &ControlTool::refresh },
    { "remove", "TYPE ID|URL", 2, "delete an item; TYPE is themelet or download",
      &ControlTool::remove },
    { "monitor", "", 0, "print each contentChanged of the service until it stops",
      &ControlTool::monitor },
    { "status", "", 0, "service, index file, schema version and row counts", &ControlTool::status },
    { "check", "PATH", 1, "check a package directory, .themelet or .index file before shipping it",
      &ControlTool::check },
};

namespace {

bool s_verbose = false;
QtMessageHandler s_defaultHandler = nullptr;

// The engine logs its own view of every failure; the user gets one line from
// us unless asking for more.
void filterMessages(QtMsgType type, const QMessageLogContext &context, const QString &message)
{
    if (s_verbose || type == QtCriticalMsg || type == QtFatalMsg)
        s_defaultHandler(type, context, message);
}

QString flagsOf(const ContentPrinter::Fields &fields)
{
    static const QPair<const char *, const char *> s_flags[] = {
        { "active", "active" }, { "favorite", "favorite" }, { "readOnly", "read-only" } };
    QStringList flags;
    for (const auto &flag : s_flags) {
        for (const auto &field : fields) {
            if (field.first == QLatin1String(flag.first) && field.second.toBool())
                flags.append(QString::fromLatin1(flag.second));
        }
    }
    return flags.join(QLatin1Char(','));
}

QString sizeOf(const PhotoData *photo)
{
    return QString::number(photo->width) + QLatin1Char('x') + QString::number(photo->height);
}

}

QString ControlTool::helpText()
{
    QString text = QStringLiteral(
            "Usage: themeletctl [--json] [--verbose] COMMAND [ARGUMENTS]\n\n"
            "The command-line client of themeletd. Reads come from the index file, writes go\n"
            "to the service on the session bus.\n\nCommands:\n");
    for (const Command &command : s_commands) {
        const QString usage = QString::fromLatin1(command.name) + QLatin1Char(' ')
                + QString::fromLatin1(command.synopsis);
        text += QStringLiteral("  ") + usage.leftJustified(30) + QLatin1Char(' ')
                + QString::fromLatin1(command.summary) + QLatin1Char('\n');
    }
    text += QStringLiteral(
            "\nAn ID is a content id; a URL may be given as a path.\n\n"
            "Options:\n"
            "  --json         print JSON (list, show, set, create, monitor, status, check)\n"
            "  -v, --verbose  show the engine's log\n"
            "  -h, --help     this text\n"
            "  --version      the version\n\n"
            "Exit status: 0 success, 1 failure (the service's message on stderr; status:\n"
            "also when themeletd is not running; check: a problem found), 2 usage error.");
    return text;
}

int ControlTool::run(const QStringList &arguments)
{
    QCommandLineParser parser;
    const QCommandLineOption jsonOption(QStringLiteral("json"));
    const QCommandLineOption verboseOption(QStringList { QStringLiteral("v"), QStringLiteral("verbose") });
    const QCommandLineOption helpOption(QStringList { QStringLiteral("h"), QStringLiteral("help") });
    const QCommandLineOption versionOption(QStringLiteral("version"));
    parser.addOptions({ jsonOption, verboseOption, helpOption, versionOption });
    if (!parser.parse(arguments))
        return usageError(parser.errorText());

    s_verbose = parser.isSet(verboseOption);
    if (!s_defaultHandler)
        s_defaultHandler = qInstallMessageHandler(filterMessages);
    m_json = parser.isSet(jsonOption);
    ContentPrinter::setJsonErrors(m_json);

    if (parser.isSet(helpOption)) {
        ContentPrinter::print(helpText());
        return Success;
    }
    if (parser.isSet(versionOption)) {
        ContentPrinter::print(QStringLiteral("themeletctl " THEMELET_VERSION));
        return Success;
    }

    QStringList positional = parser.positionalArguments();
    if (positional.isEmpty())
        return usageError(QStringLiteral("no command given"));
    const QString name = positional.takeFirst();
    for (const Command &command : s_commands) {
        if (name != QLatin1String(command.name))
            continue;
        if (positional.size() != command.argumentCount) {
            return usageError(QStringLiteral("usage: themeletctl ") + name
                              + QString::fromLatin1(*command.synopsis ? " " : "")
                              + QString::fromLatin1(command.synopsis));
        }
        return (this->*command.handler)(positional);
    }
    return usageError(QStringLiteral("unknown command '") + name + QLatin1Char('\''));
}

int ControlTool::usageError(const QString &message)
{
    ContentPrinter::printError(message, QStringLiteral("try 'themeletctl --help'"));
    return UsageError;
}

int ControlTool::failure(const QString &message)
{
    ContentPrinter::printError(message);
    return Failure;
}

bool ControlTool::serviceMissing()
{
    if (m_service.ensureRunning())
        return false;
    failure(m_service.errorString());
    return true;
}

int ControlTool::finish(const QDBusPendingCall &call)
{
    if (!m_service.wait(call))
        return failure(m_service.errorString());
    return Success;
}

bool ControlTool::isId(const QString &argument, qint64 *id)
{
    static const QRegularExpression s_digits(QStringLiteral("^[0-9]{1,18}$"));
    if (!s_digits.match(argument).hasMatch())
        return false;
    *id = argument.toLongLong();
    return true;
}

QUrl ControlTool::urlFromArgument(const QString &argument)
{
    if (argument.contains(QLatin1String("://")) || argument.startsWith(QLatin1String("file:")))
        return QUrl(argument);
    return QUrl::fromLocalFile(QDir::cleanPath(QFileInfo(argument).absoluteFilePath()));
}

Content ControlTool::lookUp(const QString &argument)
{
    qint64 id = 0;
    const Content content = isId(argument, &id) ? m_index.find(id) : m_index.find(urlFromArgument(argument));
    if (!content.isValid()) {
        failure(m_index.errorString().isEmpty() ? QStringLiteral("not in the index: ") + argument
                                                : m_index.errorString());
    }
    return content;
}

bool ControlTool::urlOf(const QString &argument, QUrl *url)
{
    qint64 id = 0;
    if (!isId(argument, &id)) {
        *url = urlFromArgument(argument);
        return true;
    }
    const Content content = lookUp(argument);
    if (content.isValid())
        *url = content.data()->url;
    return content.isValid();
}

QUrl ControlTool::activeSource() const
{
    return ThemeletSettings().source();
}

void ControlTool::printThemelet(const QString &verb, qint64 id)
{
    const Content themelet = m_index.find(id);
    if (m_json) {
        QJsonObject object;
        if (themelet.isValid())
            object = ContentPrinter::toJson(ContentPrinter::fields(themelet, activeSource()));
        else
            object.insert(QStringLiteral("contentId"), double(id));
        ContentPrinter::printJson(object);
        return;
    }
    QString line = verb + QStringLiteral(" themelet ") + QString::number(id);
    if (themelet.isValid()) {
        const auto *data = static_cast<const ThemeletData *>(themelet.data());
        line += QStringLiteral(": ") + data->displayName + QStringLiteral(" (")
                + data->url.toLocalFile() + QLatin1Char(')');
    }
    ContentPrinter::print(ContentPrinter::oneLine(line));
}

int ControlTool::list(const QStringList &arguments)
{
    static const QStringList s_kinds = { QStringLiteral("themelets"), QStringLiteral("photos"),
                                         QStringLiteral("tones") };
    const int kind = s_kinds.indexOf(arguments.first());
    if (kind < 0)
        return usageError(QStringLiteral("list what? themelets, photos or tones"));
    const IndexReader::List which = IndexReader::List(kind);

    QVector<Content> rows;
    if (!m_index.list(which, &rows))
        return failure(m_index.errorString());
    const QUrl active = which == IndexReader::Themelets ? activeSource() : QUrl();

    if (m_json) {
        QJsonArray array;
        for (const Content &row : qAsConst(rows))
            array.append(ContentPrinter::toJson(ContentPrinter::fields(row, active)));
        ContentPrinter::printJson(array);
        return Success;
    }
    if (rows.isEmpty())
        return Success;
    QVector<QStringList> table;
    switch (which) {
    case IndexReader::Themelets:
        table.append({ QStringLiteral("ID"), QStringLiteral("NAME"), QStringLiteral("FLAGS"), QStringLiteral("PATH") });
        for (const Content &row : qAsConst(rows)) {
            const auto *data = static_cast<const ThemeletData *>(row.data());
            table.append({ QString::number(data->id), data->displayName,
                           flagsOf(ContentPrinter::fields(row, active)), data->url.toLocalFile() });
        }
        break;
    case IndexReader::Photos:
        table.append({ QStringLiteral("ID"), QStringLiteral("TAKEN"), QStringLiteral("SIZE"), QStringLiteral("PATH") });
        for (const Content &row : qAsConst(rows)) {
            const auto *data = static_cast<const PhotoData *>(row.data());
            const QString taken = ContentPrinter::toText(data->dateTaken());
            table.append({ QString::number(data->id), taken.isEmpty() ? QStringLiteral("-") : taken,
                           sizeOf(data), data->url.toLocalFile() });
        }
        break;
    case IndexReader::Tones:
        table.append({ QStringLiteral("ID"), QStringLiteral("CATEGORY"), QStringLiteral("NAME"), QStringLiteral("PATH") });
        for (const Content &row : qAsConst(rows)) {
            const auto *data = static_cast<const FileData *>(row.data());
            table.append({ QString::number(data->id),
                           data->category.isEmpty() ? QStringLiteral("-") : data->category,
                           data->displayName.isEmpty() ? data->fileName : data->displayName,
                           data->url.toLocalFile() });
        }
        break;
    }
    ContentPrinter::printTable(table);
    return Success;
}

int ControlTool::show(const QStringList &arguments)
{
    const Content content = lookUp(arguments.first());
    if (!content.isValid())
        return Failure;
    const ContentPrinter::Fields fields = ContentPrinter::fields(content, activeSource());
    if (m_json)
        ContentPrinter::printJson(ContentPrinter::toJson(fields));
    else
        ContentPrinter::printFields(fields);
    return Success;
}

int ControlTool::set(const QStringList &arguments)
{
    QUrl url;
    if (serviceMissing() || !urlOf(arguments.first(), &url))
        return Failure;
    const QDBusPendingReply<qlonglong> reply = m_service.proxy()->setThemelet(url.toString());
    if (const int code = finish(reply))
        return code;
    printThemelet(QStringLiteral("Active"), reply.value());
    return Success;
}

int ControlTool::create(const QStringList &arguments)
{
    if (serviceMissing())
        return Failure;
    const QUrl url = urlFromArgument(arguments.first());
    const QDBusPendingReply<qlonglong> reply = m_service.proxy()->createThemelet(url.toString());
    if (const int code = finish(reply))
        return code;
    printThemelet(QStringLiteral("Created"), reply.value());
    return Success;
}

int ControlTool::favorite(const QStringList &arguments)
{
    static const QStringList s_on = { QStringLiteral("on"), QStringLiteral("true"), QStringLiteral("yes"),
                                      QStringLiteral("1") };
    static const QStringList s_off = { QStringLiteral("off"), QStringLiteral("false"), QStringLiteral("no"),
                                       QStringLiteral("0") };
    const QString &value = arguments.at(1);
    if (!s_on.contains(value) && !s_off.contains(value))
        return usageError(QStringLiteral("favorite takes on or off, not '") + value + QLatin1Char('\''));
    const bool on = s_on.contains(value);
    if (serviceMissing())
        return Failure;

    // A themelet is edited like the gallery does it, which also orders the
    // favourites by time; anything else is taken for a wallpaper.
    qint64 id = 0;
    const Content themelet = isId(arguments.first(), &id) ? m_index.find(id)
                                                          : m_index.find(urlFromArgument(arguments.first()));
    if (themelet.type() == ThemeletContent::Themelet) {
        const QVariantMap attributes { { QStringLiteral("favorite"), on } };
        return finish(m_service.proxy()->saveAttributes(ThemeletContent::Themelet, themelet.data()->id, attributes));
    }
    if (id)
        return failure(QStringLiteral("no themelet with id ") + arguments.first());
    const QDBusPendingReply<bool> changed = m_service.proxy()->setFavorite(urlFromArgument(arguments.first()).toString(), on);
    if (const int code = finish(changed))
        return code;
    if (!changed.value())
        return failure(QStringLiteral("no themelet has the wallpaper ") + arguments.first());
    return Success;
}

int ControlTool::install(const QStringList &arguments)
{
    if (serviceMissing())
        return Failure;
    return finish(m_service.proxy()->installPackage(QDir::cleanPath(QFileInfo(arguments.first()).absoluteFilePath())));
}

int ControlTool::index(const QStringList &arguments)
{
    if (serviceMissing())
        return Failure;
    return finish(m_service.proxy()->indexFile(urlFromArgument(arguments.first()).toString()));
}

int ControlTool::refresh(const QStringList &)
{
    if (serviceMissing())
        return Failure;
    return finish(m_service.proxy()->refreshThemelets());
}

int ControlTool::remove(const QStringList &arguments)
{
    const int type = ContentPrinter::typeFromName(arguments.first());
    if (type == ThemeletContent::File || type == ThemeletContent::Photo || type == ThemeletContent::Video) {
        // The service keeps the index of such files; it never deletes them.
        return usageError(QStringLiteral("a ") + ContentPrinter::typeName(type)
                          + QStringLiteral(" can't be removed through themeletd: delete the file itself"));
    }
    if (type != ThemeletContent::Themelet && type != ThemeletContent::Download) {
        return usageError(QStringLiteral("unknown content type '") + arguments.first()
                          + QStringLiteral("': themelet or download"));
    }
    qint64 id = 0;
    if (serviceMissing())
        return Failure;
    if (!isId(arguments.at(1), &id)) {
        const Content content = lookUp(arguments.at(1));
        if (!content.isValid())
            return Failure;
        id = content.data()->id;
    }
    return finish(m_service.proxy()->remove(type, id));
}

int ControlTool::monitor(const QStringList &)
{
    return ChangeMonitor(m_service, m_json).run();
}

int ControlTool::status(const QStringList &)
{
    const bool running = m_service.isRunning();
    const QString serviceError = running ? QString() : m_service.errorString();
    const uint pid = running ? m_service.pid() : 0;
    const QString path = IndexReader::databasePath();
    const bool exists = QFile::exists(path);
    IndexReader::Counts counts;
    int version = 0;
    const bool readable = exists && m_index.statistics(&counts, &version);
    if (exists && !readable)
        ContentPrinter::printError(m_index.errorString());
    // Before its first scan commits the index looks settled: what the service
    // has queued counts as pending too.
    const qint64 queued = running ? m_service.queued() : 0;
    for (auto &count : counts) {
        if (count.first == QLatin1String("pending") && queued > 0)
            count.second += queued;
    }
    const QUrl active = activeSource();

    if (m_json) {
        QJsonObject service { { QStringLiteral("name"), ServiceClient::serviceName() },
                              { QStringLiteral("running"), running } };
        if (pid)
            service.insert(QStringLiteral("pid"), double(pid));
        if (!running)
            service.insert(QStringLiteral("error"), serviceError);
        QJsonObject database { { QStringLiteral("path"), path }, { QStringLiteral("exists"), exists },
                               { QStringLiteral("readable"), readable } };
        if (readable)
            database.insert(QStringLiteral("schemaVersion"), version);
        else if (exists)
            database.insert(QStringLiteral("error"), m_index.errorString());
        QJsonObject rows;
        for (const auto &count : qAsConst(counts))
            rows.insert(count.first, double(count.second));
        ContentPrinter::printJson(QJsonObject {
            { QStringLiteral("service"), service }, { QStringLiteral("database"), database },
            { QStringLiteral("counts"), rows },
            { QStringLiteral("activeThemelet"), ContentPrinter::toJson(active) } });
    } else {
        QVector<QStringList> table;
        table.append({ QStringLiteral("service:"),
                       running ? QStringLiteral("running") + (pid ? QStringLiteral(" (pid ") + QString::number(pid)
                                                                            + QLatin1Char(')') : QString())
                               : m_service.connection().isConnected() ? QStringLiteral("not running")
                                                                      : QStringLiteral("unknown: ") + serviceError });
        table.append({ QStringLiteral("database:"),
                       path + (!exists ? QStringLiteral(" (missing)")
                                       : !readable ? QStringLiteral(" (unreadable)") : QString()) });
        if (readable)
            table.append({ QStringLiteral("schema version:"), QString::number(version) });
        for (const auto &count : qAsConst(counts))
            table.append({ count.first + QLatin1Char(':'), QString::number(count.second) });
        table.append({ QStringLiteral("active themelet:"),
                       active.isEmpty() ? QStringLiteral("none") : active.toLocalFile() });
        ContentPrinter::printTable(table);
    }
    return running && readable ? Success : Failure;
}

int ControlTool::check(const QStringList &arguments)
{
    PackageChecker checker;
    checker.check(arguments.first());
    const QVector<PackageChecker::Problem> problems = checker.problems();
    if (m_json) {
        QJsonArray list;
        for (const PackageChecker::Problem &problem : problems) {
            list.append(QJsonObject { { QStringLiteral("file"), problem.file },
                                      { QStringLiteral("field"), problem.field },
                                      { QStringLiteral("problem"), problem.message } });
        }
        ContentPrinter::printJson(list);
    } else {
        for (const PackageChecker::Problem &problem : problems) {
            ContentPrinter::print(ContentPrinter::oneLine(problem.file + QLatin1String(": ")
                                  + (problem.field.isEmpty() ? QString() : problem.field + QLatin1String(": "))
                                  + problem.message));
        }
        if (problems.isEmpty())
            ContentPrinter::print(arguments.first() + QLatin1String(": no problems found"));
    }
    return problems.isEmpty() ? Success : Failure;
}
