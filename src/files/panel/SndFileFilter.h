#pragma once

#include <QSortFilterProxyModel>

#include <filesystem>

namespace glimmet {

/// What the open panel lists: folders, and files whose type begins with
/// "audio". A file's type is its type attribute where it has one, else what
/// Qt's MIME database makes of its contents and name; links are followed.
class SndFileFilter : public QSortFilterProxyModel {
    Q_OBJECT

public:
    explicit SndFileFilter(QObject* parent = nullptr);

    static bool Accepts(const std::filesystem::path& entry);

protected:
    bool filterAcceptsRow(int sourceRow, const QModelIndex& sourceParent) const override;
};

}  // namespace glimmet
