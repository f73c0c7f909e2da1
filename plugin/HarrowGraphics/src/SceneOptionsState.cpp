#include "SceneOptionsState.h"

#include <MoxelGraphics/VSceneOptions.h>
#include <ZEK/Log.h>

#include <map>

namespace HarrowGraphics
{
namespace
{
using MoxelGraphics::VOptionField;

/// Group, which is empty for a plain key, and the name in it.
std::pair< QString, QString > SplitKey( const QString& i_rKey )
{
  const qsizetype Dash = i_rKey.indexOf( '-' );
  return Dash < 0 ? std::pair( QString(), i_rKey ) : std::pair( i_rKey.left( Dash ), i_rKey.mid( Dash + 1 ) );
}

std::map< QString, std::vector< const VOptionField* > > FieldsByGroup()
{
  std::map< QString, std::vector< const VOptionField* > > Groups;
  for ( const VOptionField& rField : MoxelGraphics::SceneOptionFields() )
  {
    Groups[SplitKey( rField.Key ).first].push_back( &rField );
  }
  return Groups;
}

void LogLeftOut( const QString& i_rKey, const std::string& i_rWhy )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "HarrowGraphics" );
  ZEK::Log( rCategory, ZEK::ELogWarning, "The saved option %1% is left out: %2%", i_rKey.toStdString(), i_rWhy );
}

void ReadOption( const HarrowPluginInterface::IStateReader& i_rReader, const VOptionField& i_rField,
                 MoxelGraphics::VSceneOptions& io_rOptions )
{
  QVariant Value;
  const QMetaType Type = MoxelGraphics::GetSceneOption( io_rOptions, i_rField ).metaType();
  const ZEK::IResult Result = i_rReader.Read( SplitKey( i_rField.Key ).second, Type, Value );
  if ( Result == ZEK::IResult::NotFound )
  {
    return;
  }
  if ( Result.IsError() )
  {
    LogLeftOut( i_rField.Key, Result.Text() );
  }
  else if ( !MoxelGraphics::SetSceneOption( io_rOptions, i_rField, Value ) )
  {
    LogLeftOut( i_rField.Key, "it cannot be " + Value.toString().toStdString() );
  }
}
} // namespace

void WriteOptions( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rGroup,
                   const MoxelGraphics::VSceneOptions& i_rOptions )
{
  io_rWriter.BeginGroup( i_rGroup );
  for ( const auto& [Group, Fields] : FieldsByGroup() )
  {
    if ( !Group.isEmpty() )
    {
      io_rWriter.BeginGroup( Group );
    }
    for ( const VOptionField* const pField : Fields )
    {
      io_rWriter.Write( SplitKey( pField->Key ).second, MoxelGraphics::GetSceneOption( i_rOptions, *pField ) );
    }
    if ( !Group.isEmpty() )
    {
      io_rWriter.EndGroup();
    }
  }
  io_rWriter.EndGroup();
}

void ReadOptions( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rGroup,
                  MoxelGraphics::VSceneOptions& io_rOptions )
{
  const auto pRoot = i_rReader.Child( i_rGroup );
  if ( !pRoot )
  {
    return;
  }
  for ( const auto& [Group, Fields] : FieldsByGroup() )
  {
    const auto pChild = Group.isEmpty() ? nullptr : pRoot->Child( Group );
    const HarrowPluginInterface::IStateReader* const pReader = Group.isEmpty() ? pRoot.get() : pChild.get();
    if ( !pReader )
    {
      continue;
    }
    for ( const VOptionField* const pField : Fields )
    {
      ReadOption( *pReader, *pField, io_rOptions );
    }
  }
}

} // namespace HarrowGraphics
