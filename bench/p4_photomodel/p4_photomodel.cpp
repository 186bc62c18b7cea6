// P4: the photo list of a large index. Time from componentComplete until the
// model's status is Finished with every row in place, against the sqlite3
// command line running the same SELECT into /dev/null (mean of a run before
// and one after the model). The index is made beforehand by bench_gen photodb.
//   bench_p4_photomodel PHOTOS   (in a sandbox; the index is under XDG_DATA_HOME)
#include "benchcommon.h"
#include "content.h"
#include "photodata.h"
#include "themeletcontent.h"

#if __has_include("photomodel.h")
#include "photomodel.h"
using Model = PhotoModel;
static const char *const ModelName = "PhotoModel";
#else
#include "contentmodel.h"
// Until PhotoModel exists: the same base with the photo query, as PhotoModel runs it.
class Model : public ContentModel<PhotoData>
{
public:
    Model() : ContentModel<PhotoData>(ThemeletContent::Photo) { }
    void componentComplete() override
    {
        query(new QueryAgent::Parameters);
        ContentModel<PhotoData>::componentComplete();
    }
};
static const char *const ModelName = "ContentModel<PhotoData>";
#endif

#include <QGuiApplication>
#include <QStandardPaths>

#include <fcntl.h>
#include <unistd.h>

namespace {

const char *const ListStatement =
        "SELECT file.id, directory.path || '/' || file.fileName, file.mimeType, file.fileName, file.displayName, "
        "file.permissions, image.dateTaken, image.width, image.height, image.orientation FROM file INNER JOIN "
        "directory on file.directoryId = directory.id INNER JOIN image on file.id = image.fileId ORDER BY "
        "image.dateTaken;";

// The sqlite3 command line with its output going to /dev/null; -1 if it isn't there.
double sqliteCli(const QString &index)
{
    const QString cli = QStandardPaths::findExecutable(QStringLiteral("sqlite3"));
    if (cli.isEmpty())
        return -1;
    Bench::Child child;
    const double start = Bench::now();
    const int saved = dup(STDOUT_FILENO);
    const int null = open("/dev/null", O_WRONLY);
    dup2(null, STDOUT_FILENO);
    const bool started = child.start(cli, { index, QLatin1String(ListStatement) });
    dup2(saved, STDOUT_FILENO);
    close(null);
    close(saved);
    if (!started || child.wait() != 0)
        return -1;
    return Bench::now() - start;
}

}

// A client never announces changes.
void Content::signalChanged(int)
{
}

int main(int argc, char **argv)
{
    QGuiApplication app(argc, argv);
    const int photos = app.arguments().value(1).toInt();
    const QString index = Bench::indexPath();

    const double cli1 = sqliteCli(index);

    Model model;
    const double start = Bench::now();
    model.classBegin();
    model.componentComplete();
    while (model.status() == Model::Querying || model.status() == Model::Null)
        QCoreApplication::processEvents(QEventLoop::WaitForMoreEvents);
    const double seconds = Bench::now() - start;
    const int rows = model.count();
    const bool finished = model.status() == Model::Finished;

    const double cli2 = sqliteCli(index);
    const double cli = cli1 > 0 && cli2 > 0 ? (cli1 + cli2) / 2 : -1;
    const double ratio = cli > 0 ? seconds / cli : -1;
    QString verdict = QStringLiteral("skipped");
    if (!finished || rows != photos)
        verdict = QStringLiteral("fail");
    else if (cli > 0)
        verdict = ratio <= 1.5 ? QStringLiteral("pass") : QStringLiteral("fail");
    QVariantMap values {
            { QStringLiteral("ours"), seconds },
            { QStringLiteral("unit"), QStringLiteral("s") },
            { QStringLiteral("target"), QStringLiteral("<=1.5") },
            { QStringLiteral("result"), verdict },
            { QStringLiteral("rows"), rows },
            { QStringLiteral("photos"), photos },
            { QStringLiteral("model"), QLatin1String(ModelName) },
    };
    if (cli > 0) {
        values.insert(QStringLiteral("baseline"), cli);
        values.insert(QStringLiteral("ratio"), ratio);
        values.insert(QStringLiteral("cli_runs_s"), QStringLiteral("%1/%2").arg(cli1, 0, 'f', 3).arg(cli2, 0, 'f', 3));
    } else {
        values.insert(QStringLiteral("note"), QStringLiteral("no sqlite3 command line for the baseline"));
    }
    Bench::result(QStringLiteral("P4"), values);
    return finished ? 0 : 1;
}
