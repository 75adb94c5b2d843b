// A small window that hands one file to whatever it is dragged onto, the
// way a file manager does: a press inside it starts a drag carrying the
// file's URL (text/uri-list). The real-window cases use it to drop files on
// the editor from another program.
//
//   glimmet-drag-source FILE [TITLE]
//
// The window is titled TITLE ("Drag Source" by default) and placed at the
// top left of the screen. The program prints the drag's outcome ("copy",
// "move", "link" or "ignore") after each drag and runs until it is killed.

#include <cstdio>

#include <QApplication>
#include <QDrag>
#include <QFileInfo>
#include <QMimeData>
#include <QMouseEvent>
#include <QUrl>
#include <QWidget>

namespace {

class DragSource : public QWidget {
public:
    explicit DragSource(const QString& file) : file_(file)
    {
        setFixedSize(120, 80);
        setAutoFillBackground(true);
        QPalette colours = palette();
        colours.setColor(QPalette::Window, QColor(255, 160, 0));
        setPalette(colours);
    }

protected:
    void mousePressEvent(QMouseEvent* event) override
    {
        if (event->button() != Qt::LeftButton)
            return;
        auto* data = new QMimeData;
        data->setUrls({QUrl::fromLocalFile(file_)});
        auto* drag = new QDrag(this);
        drag->setMimeData(data);
        // Every action is offered, so that a modifier held during the drop
        // (Shift asks for a move) does not turn the drop down.
        const Qt::DropAction result
            = drag->exec(Qt::CopyAction | Qt::MoveAction | Qt::LinkAction, Qt::CopyAction);
        const char* name = result == Qt::CopyAction   ? "copy"
                           : result == Qt::MoveAction ? "move"
                           : result == Qt::LinkAction ? "link"
                                                      : "ignore";
        std::printf("%s\n", name);
        std::fflush(stdout);
    }

private:
    QString file_;
};

}  // namespace

int main(int argc, char** argv)
{
    QApplication application(argc, argv);
    if (argc < 2) {
        std::fprintf(stderr, "usage: %s FILE [TITLE]\n", argv[0]);
        return 2;
    }
    DragSource window(QFileInfo(QString::fromLocal8Bit(argv[1])).absoluteFilePath());
    window.setWindowTitle(argc > 2 ? QString::fromLocal8Bit(argv[2]) : QStringLiteral("Drag Source"));
    window.move(0, 0);
    window.show();
    return application.exec();
}
