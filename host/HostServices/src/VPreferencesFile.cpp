#include <HostServices/VPreferencesFile.h>

#include <ZEK/Log.h>

#include <QtCore/QDateTime>
#include <QtCore/QFile>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QSaveFile>

namespace HostServices
{
namespace
{
const QString RecentKey = QStringLiteral( "RecentFiles" );
const QString GeometryKey = QStringLiteral( "Geometry" );
const QString LayoutsKey = QStringLiteral( "Layouts" );
const QString ValuesKey = QStringLiteral( "Values" );

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Preferences" );
  return rCategory;
}

QString Absolute( const QString& i_rPath )
{
  return QFileInfo( i_rPath ).absoluteFilePath();
}
} // namespace

VPreferencesFile::VPreferencesFile( std::filesystem::path i_Path )
  : m_Path( std::move( i_Path ) )
{
  Load();
}

void VPreferencesFile::Load()
{
  QFile File( m_Path );
  if ( !File.exists() )
  {
    return;
  }
  QByteArray Bytes;
  const bool bOpen = !QFileInfo( File ).isDir() && File.open( QIODevice::ReadOnly );
  if ( bOpen )
  {
    Bytes = File.readAll();
  }
  if ( !bOpen || File.error() != QFileDevice::NoError )
  {
    m_bUnreadable = true;
    ZEK::Log( Category(), ZEK::ELogWarning, "Cannot read preferences %1%: %2%; they are left alone, defaults hold",
              File.fileName().toStdString(), File.errorString().toStdString() );
    return;
  }
  QJsonParseError Error;
  const QJsonDocument Document = QJsonDocument::fromJson( Bytes, &Error );
  File.close();
  if ( Error.error != QJsonParseError::NoError || !Document.isObject() )
  {
    SetAside( Error.error != QJsonParseError::NoError
                  ? QStringLiteral( "%1 at offset %2" ).arg( Error.errorString() ).arg( Error.offset )
                  : QStringLiteral( "it holds no JSON object" ) );
    return;
  }
  m_Root = Document.object();
}

void VPreferencesFile::SetAside( const QString& i_rReason )
{
  const QFileInfo Info( m_Path );
  const QString Stem = Info.absolutePath() + QLatin1Char( '/' ) + Info.completeBaseName() +
                       QDateTime::currentDateTime().toString( QStringLiteral( "'.damaged-'yyyyMMdd-HHmmss" ) );
  const QString Suffix = Info.suffix().isEmpty() ? QString() : QLatin1Char( '.' ) + Info.suffix();
  QString Aside = Stem + Suffix;
  for ( int Number = 2; QFile::exists( Aside ) && Number < 1000; ++Number )
  {
    Aside = Stem + QLatin1Char( '-' ) + QString::number( Number ) + Suffix;
  }
  const bool bMoved = QFile::rename( Info.absoluteFilePath(), Aside );
  // What could not be set aside must not be written over.
  m_bUnreadable = !bMoved;
  ZEK::Log( Category(), ZEK::ELogWarning, "Preferences %1% are damaged (%2%); %3% %4%, defaults hold",
            Info.absoluteFilePath().toStdString(), i_rReason.toStdString(),
            bMoved ? "they are kept as" : "they could not be moved to", Aside.toStdString() );
}

void VPreferencesFile::Put( const QString& i_rGroup, const QString& i_rName, const QJsonValue& i_rValue )
{
  QJsonObject Group = m_Root[i_rGroup].toObject();
  if ( Group.value( i_rName ) == i_rValue )
  {
    return;
  }
  if ( i_rValue.isUndefined() )
  {
    Group.remove( i_rName );
  }
  else
  {
    Group[i_rName] = i_rValue;
  }
  m_Root[i_rGroup] = Group;
  m_bChanged = true;
}

QStringList VPreferencesFile::RecentFiles() const
{
  QStringList Files;
  for ( const QJsonValue& rValue : m_Root[RecentKey].toArray() )
  {
    const QString File = rValue.toString();
    if ( !File.isEmpty() && !Files.contains( File ) && Files.size() < MaximumRecentFiles )
    {
      Files << File;
    }
  }
  return Files;
}

void VPreferencesFile::SetRecentFiles( const QStringList& i_rFiles )
{
  if ( i_rFiles != RecentFiles() )
  {
    m_Root[RecentKey] = QJsonArray::fromStringList( i_rFiles );
    m_bChanged = true;
  }
}

void VPreferencesFile::AddRecentFile( const QString& i_rPath )
{
  if ( i_rPath.isEmpty() )
  {
    return;
  }
  QStringList Files = RecentFiles();
  Files.removeAll( Absolute( i_rPath ) );
  Files.prepend( Absolute( i_rPath ) );
  SetRecentFiles( Files.mid( 0, MaximumRecentFiles ) );
}

void VPreferencesFile::RemoveRecentFile( const QString& i_rPath )
{
  QStringList Files = RecentFiles();
  Files.removeAll( Absolute( i_rPath ) );
  SetRecentFiles( Files );
}

void VPreferencesFile::ClearRecentFiles()
{
  SetRecentFiles( {} );
}

QByteArray VPreferencesFile::Geometry( const QString& i_rName ) const
{
  return QByteArray::fromBase64( m_Root[GeometryKey].toObject().value( i_rName ).toString().toLatin1() );
}

void VPreferencesFile::SetGeometry( const QString& i_rName, const QByteArray& i_rBytes )
{
  Put( GeometryKey, i_rName,
       i_rBytes.isEmpty() ? QJsonValue( QJsonValue::Undefined ) : QString::fromLatin1( i_rBytes.toBase64() ) );
}

QStringList VPreferencesFile::LayoutNames() const
{
  return m_Root[LayoutsKey].toObject().keys();
}

QJsonObject VPreferencesFile::Layout( const QString& i_rName ) const
{
  return m_Root[LayoutsKey].toObject().value( i_rName ).toObject();
}

void VPreferencesFile::SetLayout( const QString& i_rName, const QJsonObject& i_rLayout )
{
  Put( LayoutsKey, i_rName, i_rLayout.isEmpty() ? QJsonValue( QJsonValue::Undefined ) : QJsonValue( i_rLayout ) );
}

QJsonValue VPreferencesFile::Value( const QString& i_rKey ) const
{
  return m_Root[ValuesKey].toObject().value( i_rKey );
}

void VPreferencesFile::SetValue( const QString& i_rKey, const QJsonValue& i_rValue )
{
  Put( ValuesKey, i_rKey, i_rValue );
}

ZEK::IResult VPreferencesFile::Save()
{
  if ( !m_bChanged )
  {
    return ZEK::IResult::OkButNoEffect;
  }
  if ( m_bUnreadable )
  {
    return ZEK::IResult::NotPermitted;
  }
  std::error_code Ignored;
  std::filesystem::create_directories( m_Path.parent_path(), Ignored );
  QSaveFile File( QFileInfo( m_Path ).absoluteFilePath() );
  const QByteArray Bytes = QJsonDocument( m_Root ).toJson();
  if ( !File.open( QIODevice::WriteOnly ) || File.write( Bytes ) != Bytes.size() || !File.commit() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Cannot write preferences %1%: %2%", File.fileName().toStdString(),
              File.errorString().toStdString() );
    return ZEK::IResult::FileIOFailure;
  }
  m_bChanged = false;
  return ZEK::IResult::Ok;
}

} // namespace HostServices
