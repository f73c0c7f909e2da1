#pragma once

#include <ZEK/Result.h>

#include <QtCore/QJsonObject>
#include <QtCore/QStringList>

#include <filesystem>

namespace HostServices
{

/// What the program remembers between runs: recent files, window geometry, and layouts, in one small JSON file.
///
/// A file that is damaged is set aside beside itself under a dated name and the defaults hold; one that cannot be
/// read is left alone and never written over. Thread: GUI.
class VPreferencesFile
{
public:
  static constexpr int MaximumRecentFiles = 12;

  /// Reads the file; a missing one gives the defaults without a word.
  explicit VPreferencesFile( std::filesystem::path i_Path );

  /// Absolute paths, newest first.
  QStringList RecentFiles() const;
  void AddRecentFile( const QString& i_rPath );
  void RemoveRecentFile( const QString& i_rPath );
  void ClearRecentFiles();

  /// Bytes such as those of QWidget::saveGeometry, under a name; empty when there are none.
  QByteArray Geometry( const QString& i_rName ) const;
  void SetGeometry( const QString& i_rName, const QByteArray& i_rBytes );

  QStringList LayoutNames() const;
  QJsonObject Layout( const QString& i_rName ) const;
  /// An empty object removes the layout.
  void SetLayout( const QString& i_rName, const QJsonObject& i_rLayout );

  /// Any other setting of the host.
  QJsonValue Value( const QString& i_rKey ) const;
  void SetValue( const QString& i_rKey, const QJsonValue& i_rValue );

  /// Writes the file if something changed, all of it or nothing. `FileIOFailure`, with a log line of level 3, when
  /// it cannot be written; the changes are kept for the next try. `NotPermitted` over a file that could not be read.
  ZEK::IResult Save();
  const std::filesystem::path& Path() const { return m_Path; }

private:
  void Load();
  void SetRecentFiles( const QStringList& i_rFiles );
  void SetAside( const QString& i_rReason );
  void Put( const QString& i_rGroup, const QString& i_rName, const QJsonValue& i_rValue );

  std::filesystem::path m_Path;
  QJsonObject m_Root;
  bool m_bChanged = false;
  bool m_bUnreadable = false;
};

} // namespace HostServices
