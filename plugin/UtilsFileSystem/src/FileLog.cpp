#include "FileLog.h"

#include <UtilsFileSystem/FileIO.h>

using namespace ZEK;

namespace UtilsFileSystem
{

VLogCategory& FileCategory()
{
  static VLogCategory& rCategory = GlobalLog().Category( "UtilsFileSystem" );
  return rCategory;
}

void LogFailure( const std::string& i_rPath, const std::string& i_rHeld, IResult i_Result, const char* i_pLocked,
                 const char* i_pPlain )
{
  if ( !FileCategory().IsOn( ELogFailure ) )
  {
    return;
  }
  std::string Names;
  if ( i_Result == IResult::NotPermitted )
  {
    for ( const std::string& rName : ListLockingProcesses( i_rHeld ) )
    {
      Names.append( Names.empty() ? "" : "', '" ).append( rName );
    }
  }
  if ( Names.empty() )
  {
    Log( FileCategory(), ELogFailure, i_pPlain, i_rPath, i_Result.Text() );
  }
  else
  {
    Log( FileCategory(), ELogFailure, i_pLocked, i_rPath, Names );
  }
}

void LogFailure( const std::string& i_rPath, IResult i_Result, const char* i_pLocked, const char* i_pPlain )
{
  LogFailure( i_rPath, i_rPath, i_Result, i_pLocked, i_pPlain );
}

} // namespace UtilsFileSystem
