#include <HostServices/VActivityMode.h>
#include <HostServices/VFeatureFlags.h>

namespace HostServices
{
namespace
{
struct VProfile
{
  const char* pName;
  std::uint32_t Flags;
};
constexpr VProfile Profiles[] = { { "subjects", VFeatureFlags::SubjectsProfile },
                                  { "objects", VFeatureFlags::ObjectsProfile } };
} // namespace

std::vector< std::string > VActivityMode::KnownNames()
{
  return { "Live", "Playback", "Camera Calibration" };
}

void VActivityMode::SetName( const std::string& i_rName )
{
  if ( m_Name != i_rName )
  {
    m_Name = i_rName;
    m_Changed.Fire();
  }
}

QStringList VFeatureFlags::ProfileNames()
{
  QStringList Names;
  for ( const VProfile& rProfile : Profiles )
  {
    Names << QLatin1String( rProfile.pName );
  }
  return Names;
}

QString VFeatureFlags::ProfileName() const
{
  for ( const VProfile& rProfile : Profiles )
  {
    if ( rProfile.Flags == m_Flags )
    {
      return QLatin1String( rProfile.pName );
    }
  }
  return QStringLiteral( "custom" );
}

void VFeatureFlags::SetFlags( std::uint32_t i_Flags )
{
  if ( m_Flags != i_Flags )
  {
    m_Flags = i_Flags;
    m_Changed.Fire();
  }
}

ZEK::IResult VFeatureFlags::SetFromText( const QString& i_rText )
{
  const QString Text = i_rText.trimmed();
  for ( const VProfile& rProfile : Profiles )
  {
    if ( Text.compare( QLatin1String( rProfile.pName ), Qt::CaseInsensitive ) == 0 )
    {
      SetFlags( rProfile.Flags );
      return ZEK::IResult::Ok;
    }
  }
  bool bWord = false;
  const bool bHex = Text.startsWith( QLatin1String( "0x" ), Qt::CaseInsensitive );
  const std::uint32_t Flags = Text.toUInt( &bWord, bHex ? 16 : 10 );
  if ( !bWord )
  {
    return ZEK::IResult::InvalidValue;
  }
  SetFlags( Flags );
  return ZEK::IResult::Ok;
}

} // namespace HostServices
