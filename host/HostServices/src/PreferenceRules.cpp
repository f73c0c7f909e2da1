#include <HostServices/PreferenceRules.h>

#include <ZEK/Serialiser.h>
#include <ZEK/StoreFlags.h>
#include <ZEK/TypedValueText.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QFileInfo>

#include <limits>

namespace HostServices
{
namespace
{
using ZEK::VTypedValue;
using ZEK::IO::EType;

QString Tr( const char* i_pText )
{
  return QCoreApplication::translate( "HostServices::PreferenceRules", i_pText );
}

/// Calls the function with a 0 of the C++ type of that number type; false for other types.
template < typename F >
bool WithNumber( EType i_Type, const F& i_rFunction )
{
  switch ( i_Type )
  {
  case EType::Int8:
    return i_rFunction( std::int8_t() );
  case EType::Int16:
    return i_rFunction( std::int16_t() );
  case EType::Int32:
    return i_rFunction( std::int32_t() );
  case EType::Int64:
    return i_rFunction( std::int64_t() );
  case EType::UInt8:
    return i_rFunction( std::uint8_t() );
  case EType::UInt16:
    return i_rFunction( std::uint16_t() );
  case EType::UInt32:
    return i_rFunction( std::uint32_t() );
  case EType::UInt64:
    return i_rFunction( std::uint64_t() );
  case EType::Float32:
    return i_rFunction( float() );
  case EType::Float64:
    return i_rFunction( double() );
  default:
    return false;
  }
}

template < typename T >
T AddWithin( T i_Value, std::int64_t i_Amount, T i_Minimum, T i_Maximum )
{
  if constexpr ( std::is_floating_point_v< T > )
  {
    return std::clamp( i_Value + static_cast< T >( i_Amount ), i_Minimum, i_Maximum );
  }
  else
  {
    // How far it is to the end is asked in unsigned numbers, which hold every distance.
    const std::uint64_t Value = static_cast< std::uint64_t >( i_Value );
    const std::uint64_t Amount = static_cast< std::uint64_t >( i_Amount );
    if ( i_Amount >= 0 )
    {
      const bool bFits = i_Value < i_Maximum && Amount <= static_cast< std::uint64_t >( i_Maximum ) - Value;
      return bFits ? std::max( static_cast< T >( Value + Amount ), i_Minimum ) : i_Maximum;
    }
    const bool bFits = i_Value > i_Minimum && 0 - Amount <= Value - static_cast< std::uint64_t >( i_Minimum );
    return bFits ? std::min( static_cast< T >( Value + Amount ), i_Maximum ) : i_Minimum;
  }
}

QString Plain( const VTypedValue& i_rValue )
{
  std::string Text;
  if ( i_rValue.Schema()->m_Type == EType::String )
  {
    (void)ZEK::IO::ReadTyped( i_rValue, Text );
  }
  else
  {
    (void)ZEK::IO::ValueToText( i_rValue, Text );
  }
  return QString::fromStdString( Text );
}

QString WithUnit( const QString& i_rText, const QString& i_rUnit )
{
  return i_rUnit.isEmpty() ? i_rText : i_rText + QChar( QChar::Nbsp ) + i_rUnit;
}

QString WhyOutOfRange( const VTypedValue& i_rValue, const VTypedValue& i_rMinimum, const VTypedValue& i_rMaximum,
                       const QString& i_rUnit )
{
  int Order = 0;
  const bool bLow = CompareNumbers( i_rValue, i_rMinimum, Order ) && Order < 0;
  const bool bHigh = CompareNumbers( i_rValue, i_rMaximum, Order ) && Order > 0;
  return bLow || bHigh
             ? Tr( "%1 is not %2." )
                   .arg( WithUnit( Plain( i_rValue ), i_rUnit ), RangeText( i_rMinimum, i_rMaximum, i_rUnit ) )
             : QString();
}

QString WhyNoFolder( const VTypedValue& i_rValue )
{
  const QString Path = Plain( i_rValue );
  const QFileInfo Info( Path );
  if ( Path.isEmpty() || ( Info.isAbsolute() && ( Info.isDir() || !Info.exists() ) ) )
  {
    return {};
  }
  return Info.isAbsolute() ? Tr( "%1 is a file, not a folder." ).arg( Path )
                           : Tr( "“%1” is not a whole path: a folder is given from the root on." ).arg( Path );
}
} // namespace

const VTypedValue& EditedValue( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry )
{
  return ( i_rReader.Flags( i_pEntry ) & ZEK::EVerifyRequired ) != 0 ? i_rReader.ProposedValue( i_pEntry )
                                                                     : i_rReader.VerifiedValue( i_pEntry );
}

bool IsNumber( const ZEK::IO::ISchema* i_pSchema )
{
  return WithNumber( i_pSchema->m_Type,
                     []( auto )
                     {
                       return true;
                     } );
}

bool CompareNumbers( const VTypedValue& i_rA, const VTypedValue& i_rB, int& o_rOrder )
{
  return WithNumber( i_rA.Schema()->m_Type,
                     [&]( auto i_Zero )
                     {
                       auto A = i_Zero;
                       auto B = i_Zero;
                       if ( !ZEK::IO::ReadTyped( i_rA, A ) || !ZEK::IO::ReadTyped( i_rB, B ) )
                       {
                         return false;
                       }
                       o_rOrder = A < B ? -1 : ( A > B ? 1 : 0 );
                       return true;
                     } );
}

void AddToNumber( VTypedValue& io_rNumber, std::int64_t i_Amount, const VTypedValue& i_rMinimum,
                  const VTypedValue& i_rMaximum )
{
  (void)WithNumber( io_rNumber.Schema()->m_Type,
                    [&]( auto i_Zero )
                    {
                      using T = decltype( i_Zero );
                      T Value = i_Zero;
                      T Minimum = std::numeric_limits< T >::lowest();
                      T Maximum = std::numeric_limits< T >::max();
                      (void)ZEK::IO::ReadTyped( i_rMinimum, Minimum );
                      (void)ZEK::IO::ReadTyped( i_rMaximum, Maximum );
                      const bool bRead = ZEK::IO::ReadTyped( io_rNumber, Value ) && Minimum <= Maximum;
                      if ( bRead )
                      {
                        io_rNumber = ZEK::IO::MakeValue( AddWithin( Value, i_Amount, Minimum, Maximum ) );
                      }
                      return bRead;
                    } );
}

QString WhyRefused( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry, const VTypedValue& i_rValue )
{
  const ZEK::IO::ISchema* const pSchema = i_rReader.Schema( i_pEntry );
  if ( !i_rReader.Exists( i_pEntry ) )
  {
    return Tr( "This setting is not there any more." );
  }
  if ( ( i_rReader.Flags( i_pEntry ) & ZEK::EReadout ) != 0 )
  {
    return Tr( "The program itself sets this; it cannot be changed." );
  }
  if ( i_rValue.Schema() != pSchema || !ZEK::IO::IsWellFormed( i_rValue ) )
  {
    return Tr( "This setting takes a value of the type %1." ).arg( ZEK::IO::TypeName( pSchema->m_Type ) );
  }
  const std::vector< VTypedValue >& rChoices = i_rReader.Choices( i_pEntry );
  if ( !rChoices.empty() && std::find( rChoices.begin(), rChoices.end(), i_rValue ) == rChoices.end() )
  {
    return Tr( "%1 is not one of the choices." ).arg( ValueForPeople( i_rReader, i_pEntry, i_rValue ) );
  }
  if ( i_rReader.ExtraText2( i_pEntry ) == FolderKind )
  {
    return WhyNoFolder( i_rValue );
  }
  return WhyOutOfRange( i_rValue, i_rReader.Minimum( i_pEntry ), i_rReader.Maximum( i_pEntry ),
                        QString::fromStdString( i_rReader.ExtraText1( i_pEntry ) ) );
}

QString RangeText( const VTypedValue& i_rMinimum, const VTypedValue& i_rMaximum, const QString& i_rUnit )
{
  const QString Minimum = Plain( i_rMinimum );
  const QString Maximum = Plain( i_rMaximum );
  if ( Minimum.isEmpty() )
  {
    return Maximum.isEmpty() ? QString() : Tr( "at most %1" ).arg( WithUnit( Maximum, i_rUnit ) );
  }
  return Maximum.isEmpty() ? Tr( "at least %1" ).arg( WithUnit( Minimum, i_rUnit ) )
                           : Tr( "from %1 to %2" ).arg( Minimum, WithUnit( Maximum, i_rUnit ) );
}

QString ValueForPeople( const ZEK::IStoreReader& i_rReader, ZEK::IStoreReader::Entry i_pEntry,
                        const VTypedValue& i_rValue )
{
  const std::vector< VTypedValue >& rChoices = i_rReader.Choices( i_pEntry );
  const std::vector< std::string >& rTexts = i_rReader.ChoiceTexts( i_pEntry );
  const auto Index =
      static_cast< std::size_t >( std::find( rChoices.begin(), rChoices.end(), i_rValue ) - rChoices.begin() );
  if ( Index < rChoices.size() && Index < rTexts.size() && !rTexts[Index].empty() )
  {
    return QString::fromStdString( rTexts[Index] );
  }
  bool bOn = false;
  if ( ZEK::IO::ReadTyped( i_rValue, bOn ) )
  {
    return bOn ? Tr( "on" ) : Tr( "off" );
  }
  const QString Text = Plain( i_rValue );
  return IsNumber( i_rValue.Schema() ) ? WithUnit( Text, QString::fromStdString( i_rReader.ExtraText1( i_pEntry ) ) )
                                       : Text;
}

} // namespace HostServices
