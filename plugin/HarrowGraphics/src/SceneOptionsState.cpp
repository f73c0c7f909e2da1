#include "SceneOptionsState.h"

#include <ZEK/Log.h>

#include <QtQml/QQmlPropertyMap>

#include <map>

namespace HarrowGraphics
{
namespace
{
/// Group, which is empty for a plain key, and the name in it.
std::pair< QString, QString > SplitKey( const QString& i_rKey )
{
  const qsizetype Dash = i_rKey.indexOf( '-' );
  return Dash < 0 ? std::pair( QString(), i_rKey ) : std::pair( i_rKey.left( Dash ), i_rKey.mid( Dash + 1 ) );
}

std::map< QString, QStringList > KeysByGroup( const QQmlPropertyMap& i_rOptions )
{
  std::map< QString, QStringList > Groups;
  for ( const QString& rKey : i_rOptions.keys() )
  {
    Groups[SplitKey( rKey ).first].push_back( rKey );
  }
  return Groups;
}
} // namespace

void WriteOptions( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rGroup,
                   const QQmlPropertyMap& i_rOptions )
{
  io_rWriter.BeginGroup( i_rGroup );
  for ( const auto& [Group, Keys] : KeysByGroup( i_rOptions ) )
  {
    if ( !Group.isEmpty() )
    {
      io_rWriter.BeginGroup( Group );
    }
    for ( const QString& rKey : Keys )
    {
      io_rWriter.Write( SplitKey( rKey ).second, i_rOptions.value( rKey ) );
    }
    if ( !Group.isEmpty() )
    {
      io_rWriter.EndGroup();
    }
  }
  io_rWriter.EndGroup();
}

void ReadOptions( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rGroup,
                  const QQmlPropertyMap& i_rOptions,
                  const std::function< void( const QString&, const QVariant& ) >& i_rSet )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "HarrowGraphics" );
  const auto pRoot = i_rReader.Child( i_rGroup );
  if ( !pRoot )
  {
    return;
  }
  for ( const auto& [Group, Keys] : KeysByGroup( i_rOptions ) )
  {
    const auto pChild = Group.isEmpty() ? nullptr : pRoot->Child( Group );
    const HarrowPluginInterface::IStateReader* const pReader = Group.isEmpty() ? pRoot.get() : pChild.get();
    for ( const QString& rKey : Keys )
    {
      QVariant Value;
      const ZEK::IResult Result =
          pReader ? pReader->Read( SplitKey( rKey ).second, i_rOptions.value( rKey ).metaType(), Value )
                  : ZEK::IResult( ZEK::IResult::NotFound );
      if ( Result.IsOk() )
      {
        i_rSet( rKey, Value );
      }
      else if ( Result != ZEK::IResult::NotFound )
      {
        ZEK::Log( rCategory, ZEK::ELogWarning, "The saved option %1% is left out: %2%", rKey.toStdString(),
                  Result.Text() );
      }
    }
  }
}

} // namespace HarrowGraphics
