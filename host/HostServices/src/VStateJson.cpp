#include <HostServices/VStateJson.h>

#include <ZEK/Log.h>

#include <QtCore/QJsonArray>

#include <cmath>
#include <limits>

namespace HostServices
{
namespace
{
ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "WindowState" );
  return rCategory;
}

bool IsUnsigned( int i_Type )
{
  return i_Type == QMetaType::UChar || i_Type == QMetaType::UShort || i_Type == QMetaType::UInt ||
         i_Type == QMetaType::ULong || i_Type == QMetaType::ULongLong;
}

bool IsWhole( int i_Type )
{
  return IsUnsigned( i_Type ) || i_Type == QMetaType::Char || i_Type == QMetaType::SChar ||
         i_Type == QMetaType::Short || i_Type == QMetaType::Int || i_Type == QMetaType::Long ||
         i_Type == QMetaType::LongLong;
}

/// Undefined for a value that has no place in the file.
QJsonValue ToJson( const QVariant& i_rValue )
{
  const int Type = i_rValue.typeId();
  if ( Type == QMetaType::Bool )
  {
    return i_rValue.toBool();
  }
  if ( IsUnsigned( Type ) && i_rValue.toULongLong() > std::numeric_limits< qint64 >::max() )
  {
    return QJsonValue( QJsonValue::Undefined );
  }
  if ( IsWhole( Type ) )
  {
    return i_rValue.toLongLong();
  }
  if ( Type == QMetaType::Double || Type == QMetaType::Float )
  {
    const double Number = i_rValue.toDouble();
    return std::isfinite( Number ) ? QJsonValue( Number ) : QJsonValue( QJsonValue::Undefined );
  }
  if ( Type == QMetaType::QString )
  {
    return i_rValue.toString();
  }
  if ( Type == QMetaType::QStringList )
  {
    return QJsonArray::fromStringList( i_rValue.toStringList() );
  }
  return QJsonValue( QJsonValue::Undefined );
}

QVariant WholeFromJson( const QJsonValue& i_rValue, QMetaType i_Type )
{
  // Two different defaults tell a number with a fraction from one of their own value.
  const qint64 Number = i_rValue.toInteger( 0 );
  if ( Number != i_rValue.toInteger( 1 ) || ( IsUnsigned( i_Type.id() ) && Number < 0 ) )
  {
    return {};
  }
  QVariant Value( Number );
  return Value.convert( i_Type ) && Value.toLongLong() == Number ? Value : QVariant();
}

QVariant ListFromJson( const QJsonArray& i_rArray )
{
  QStringList List;
  for ( const QJsonValue& rValue : i_rArray )
  {
    if ( !rValue.isString() )
    {
      return {};
    }
    List << rValue.toString();
  }
  return List;
}

/// Invalid for a value of another type.
QVariant FromJson( const QJsonValue& i_rValue, QMetaType i_Type )
{
  const int Type = i_Type.id();
  if ( Type == QMetaType::Bool )
  {
    return i_rValue.isBool() ? QVariant( i_rValue.toBool() ) : QVariant();
  }
  if ( IsWhole( Type ) )
  {
    return i_rValue.isDouble() ? WholeFromJson( i_rValue, i_Type ) : QVariant();
  }
  if ( Type == QMetaType::Double || Type == QMetaType::Float )
  {
    const double Number = i_rValue.toDouble();
    const bool bFits = Type == QMetaType::Double || std::abs( Number ) <= std::numeric_limits< float >::max();
    QVariant Value( Number );
    return i_rValue.isDouble() && bFits && Value.convert( i_Type ) ? Value : QVariant();
  }
  if ( Type == QMetaType::QString )
  {
    return i_rValue.isString() ? QVariant( i_rValue.toString() ) : QVariant();
  }
  return Type == QMetaType::QStringList && i_rValue.isArray() ? ListFromJson( i_rValue.toArray() ) : QVariant();
}
} // namespace

void VStateJsonWriter::BeginGroup( const QString& i_rName )
{
  m_Groups.push_back( { i_rName, m_Groups.back().Values.value( i_rName ).toObject() } );
}

void VStateJsonWriter::EndGroup()
{
  if ( m_Groups.size() < 2 )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "A group ends that was not begun" );
    return;
  }
  VGroup Group = std::move( m_Groups.back() );
  m_Groups.pop_back();
  m_Groups.back().Values[Group.Name] = Group.Values;
}

void VStateJsonWriter::Write( const QString& i_rName, const QVariant& i_rValue )
{
  const QJsonValue Value = ToJson( i_rValue );
  if ( Value.isUndefined() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The state %1% of type %2% cannot be saved", i_rName.toStdString(),
              i_rValue.isValid() ? i_rValue.typeName() : "none" );
    return;
  }
  m_Groups.back().Values[i_rName] = Value;
}

QJsonObject VStateJsonWriter::Object() const
{
  QJsonObject Object = m_Groups.back().Values;
  for ( auto Group = m_Groups.size() - 1; Group > 0; --Group )
  {
    QJsonObject Parent = m_Groups[Group - 1].Values;
    Parent[m_Groups[Group].Name] = Object;
    Object = Parent;
  }
  return Object;
}

ZEK::IResult VStateJsonReader::Read( const QString& i_rName, QMetaType i_Type, QVariant& o_rValue ) const
{
  const QJsonValue Value = m_Object.value( i_rName );
  if ( Value.isUndefined() )
  {
    return ZEK::IResult::NotFound;
  }
  const QVariant Converted = FromJson( Value, i_Type );
  if ( !Converted.isValid() )
  {
    return ZEK::IResult::InvalidType;
  }
  o_rValue = Converted;
  return ZEK::IResult::Ok;
}

std::unique_ptr< HarrowPluginInterface::IStateReader > VStateJsonReader::Child( const QString& i_rName ) const
{
  const QJsonValue Value = m_Object.value( i_rName );
  return Value.isObject() ? std::make_unique< VStateJsonReader >( Value.toObject() ) : nullptr;
}

} // namespace HostServices
