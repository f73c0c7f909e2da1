#include <HostServices/VPaths.h>

#include <ZEK/Log.h>

#include <QtCore/QStandardPaths>

namespace HostServices
{
namespace
{
struct VKindFolder
{
  std::uint32_t Kind;
  const char* pName;
};
constexpr VKindFolder KindFolders[] = {
    { HarrowPluginInterface::EFolderSubjects, "Subjects" },
    { HarrowPluginInterface::EFolderProps, "Props" },
    { HarrowPluginInterface::EFolderTrackingSubjects, "TrackingSubjects" },
    { HarrowPluginInterface::EFolderRetargetSubjects, "RetargetSubjects" },
    { HarrowPluginInterface::EFolderSceneMeshes, "SceneMeshes" },
};

std::filesystem::path Root( std::filesystem::path i_Given )
{
  if ( i_Given.empty() )
  {
    i_Given = QStandardPaths::writableLocation( QStandardPaths::AppDataLocation ).toStdU16String();
  }
  std::error_code Ignored;
  std::filesystem::path Absolute = std::filesystem::absolute( i_Given, Ignored );
  const std::filesystem::path Normal = ( Absolute.empty() ? i_Given : Absolute ).lexically_normal();
  // A separator at the end would make equal folders differ.
  return Normal.has_filename() || Normal == Normal.root_path() ? Normal : Normal.parent_path();
}

/// With a mark in the place of bytes that are no UTF-8, where the path's own conversion would throw.
std::wstring Wide( const std::filesystem::path& i_rPath )
{
  return QString::fromStdString( i_rPath.string() ).toStdWString();
}
} // namespace

VPaths::VPaths( std::filesystem::path i_ContentRoot, std::filesystem::path i_UserRoot )
  : m_ContentRoot( Root( std::move( i_ContentRoot ) ) )
  , m_UserRoot( Root( std::move( i_UserRoot ) ) )
{
}

std::vector< std::wstring >& VPaths::FoldersOfKind( std::vector< std::wstring >& o_rFolders,
                                                    std::uint32_t i_KindMask ) const
{
  o_rFolders.clear();
  const auto Add = [&]( const std::filesystem::path& i_rFolder )
  {
    MakeFolder( i_rFolder );
    o_rFolders.push_back( Wide( i_rFolder ) );
  };
  for ( const VKindFolder& rKind : KindFolders )
  {
    if ( i_KindMask & rKind.Kind )
    {
      Add( m_ContentRoot / rKind.pName );
      if ( m_UserRoot != m_ContentRoot )
      {
        Add( m_UserRoot / rKind.pName );
      }
    }
  }
  return o_rFolders;
}

std::wstring VPaths::BaseFolder() const
{
  return Wide( m_ContentRoot );
}

void VPaths::MakeFolder( const std::filesystem::path& i_rFolder ) const
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Paths" );
  std::error_code Error;
  std::filesystem::create_directories( i_rFolder, Error );
  // Some file in the place of the folder is no error to the call above in every library version.
  std::error_code Ignored;
  const bool bThere = std::filesystem::is_directory( i_rFolder, Ignored );
  if ( !bThere && m_Reported.insert( i_rFolder ).second )
  {
    ZEK::Log( rCategory, ZEK::ELogWarning, "Cannot create folder %1%: %2%", i_rFolder.string(),
              Error ? Error.message() : std::string( "a file of that name is in its place" ) );
  }
}

} // namespace HostServices
