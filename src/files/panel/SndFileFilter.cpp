#include "files/panel/SndFileFilter.h"

#include <QFileSystemModel>
#include <QMimeDatabase>

#include <string>
#include <system_error>

#include "files/FileTypeAttribute.h"

namespace glimmet {

namespace {

bool IsAudioType(const std::string& type)
{
    return type.compare(0, 5, "audio") == 0;
}

}  // namespace

SndFileFilter::SndFileFilter(QObject* parent) : QSortFilterProxyModel(parent) {}

bool SndFileFilter::Accepts(const std::filesystem::path& entry)
{
    std::error_code error;
    const std::filesystem::path target = std::filesystem::canonical(entry, error);
    if (error)
        return false;
    if (std::filesystem::is_directory(target, error))
        return true;
    // A type the file was given wins over any guess.
    const std::string attribute = FileType(target);
    if (!attribute.empty())
        return IsAudioType(attribute);
    static const QMimeDatabase database;
    const QMimeType type = database.mimeTypeForFile(QString::fromStdString(target.string()));
    return IsAudioType(type.name().toStdString());
}

bool SndFileFilter::filterAcceptsRow(int sourceRow, const QModelIndex& sourceParent) const
{
    const auto* files = qobject_cast<const QFileSystemModel*>(sourceModel());
    if (files == nullptr)
        return true;
    const QModelIndex index = files->index(sourceRow, 0, sourceParent);
    // The folders above the listed one hold the view's path; they stay.
    if (files->isDir(index))
        return true;
    return Accepts(std::filesystem::path(files->filePath(index).toStdString()));
}

}  // namespace glimmet
