#include "FileLog.h"
#include "SaveSteps.h"

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
constexpr int PauseMilliseconds = 10;
constexpr int MostTurns = 200;
/// How often a recovery that failed is tried again.
constexpr int TurnsBetweenTries = 50;

class VLoad
{
public:
  VLoad( const PathFunction& i_rRead, const std::string& i_rTarget, bool i_bHeld )
    : m_rRead( i_rRead )
    , m_rTarget( i_rTarget )
    , m_bHeld( i_bHeld )
  {
  }

  IResult Run();

private:
  bool Recover( const VSaveNames& i_rNames, int i_Turn );
  void RecoverLocked( const VSaveNames& i_rNames );
  bool MayBeInBetween( const VSaveNames& i_rNames, const VNeighbours& i_rBefore ) const;
  void RemoveStale( const VSaveNames& i_rNames ) const;

  const PathFunction& m_rRead;
  const std::string& m_rTarget;
  bool m_bHeld;
  bool m_bTried = false;
};

/// False while another process is at work.
bool VLoad::Recover( const VSaveNames& i_rNames, int i_Turn )
{
  if ( m_bTried && i_Turn % TurnsBetweenTries != 0 )
  {
    return true;
  }
  Platform::VLockFile Lock;
  const IResult Locked = m_bHeld ? IResult::Ok : TakeLock( i_rNames, Lock );
  if ( Locked == IResult::WouldBlock )
  {
    return false;
  }
  if ( Locked.IsOk() )
  {
    RecoverLocked( i_rNames );
  }
  else if ( !m_bTried )
  {
    Log( FileCategory(), ELogWarning, "Interrupted save of [%1%] cannot be looked after: %2%", i_rNames.Target,
         Locked.Text() );
  }
  m_bTried = true;
  return true;
}

void VLoad::RecoverLocked( const VSaveNames& i_rNames )
{
  VNeighbours Found( i_rNames );
  if ( Found.New.IsFile() && Found.Old.IsFile() )
  {
    Log( FileCategory(), ELogWarning,
         "Interrupted save detected for [%1%], attempting to complete save of new data [%2%]...", i_rNames.Target,
         i_rNames.New );
    if ( CompleteSave( i_rNames, true ).IsOk() )
    {
      return;
    }
    Found = VNeighbours( i_rNames );
  }
  else if ( Found.New.IsFile() )
  {
    Log( FileCategory(), ELogWarning,
         "Interrupted save detected for [%1%], ignoring potentially corrupt new data [%2%]", i_rNames.Target,
         i_rNames.New );
  }
  if ( Found.New.IsFile() || !Found.Old.IsFile() )
  {
    return;
  }
  if ( Found.Target.IsThere() )
  {
    (void)Platform::Remove( i_rNames.Old );
  }
  else if ( Found.Target.Status == Platform::EFileAbsent )
  {
    (void)RestoreBackup( i_rNames, !m_bTried );
  }
}

/// After the target was not found: true unless it is certain that there is nothing to find.
bool VLoad::MayBeInBetween( const VSaveNames& i_rNames, const VNeighbours& i_rBefore ) const
{
  Platform::VLockFile Lock;
  if ( !m_bHeld && Platform::FactsOf( i_rNames.Lock ).IsThere() && TakeLock( i_rNames, Lock ) == IResult::WouldBlock )
  {
    return true;
  }
  const VNeighbours After( i_rNames );
  if ( After.Error().IsError() || After.IsTargetAside() )
  {
    return true;
  }
  return After.Target.IsThere() && !( i_rBefore.Target.IsThere() && i_rBefore.Target.IsSame( After.Target ) );
}

void VLoad::RemoveStale( const VSaveNames& i_rNames ) const
{
  Platform::VLockFile Lock;
  if ( Platform::FactsOf( i_rNames.Stale ).IsFile() && ( m_bHeld || TakeLock( i_rNames, Lock ).IsOk() ) )
  {
    (void)Platform::Remove( i_rNames.Stale );
  }
}

IResult VLoad::Run()
{
  std::string Target;
  for ( int Turn = 0; Turn < MostTurns; ++Turn )
  {
    if ( Turn > 0 )
    {
      Platform::Pause( PauseMilliseconds );
    }
    Platform::VFileFacts Facts;
    if ( Platform::ResolveLinks( m_rTarget, Target, Facts ).IsError() )
    {
      Target = m_rTarget;
    }
    const VSaveNames Names( Target );
    VNeighbours Found( Names );
    if ( Found.IsToRecover() )
    {
      if ( !Recover( Names, Turn ) )
      {
        continue;
      }
      Found = VNeighbours( Names );
      if ( Found.IsTargetAside() )
      {
        continue;
      }
    }
    const IResult Result = CallBack( m_rRead, m_rTarget );
    if ( Result == IResult::FileNotFound && MayBeInBetween( Names, Found ) )
    {
      continue;
    }
    if ( Result.IsOk() )
    {
      RemoveStale( Names );
    }
    return Result;
  }
  LogLocked( VSaveNames( Target ), "Failed to load file '%1%': file is locked by processes '%2%'.",
             "Failed to load file '%1%': %2%" );
  return IResult::NotPermitted;
}
} // namespace

IResult ProtectedLoad( const PathFunction& i_rRead, const std::string& i_rTarget )
{
  return VLoad( i_rRead, i_rTarget, false ).Run();
}

IResult ProtectedLoad( const PathFunction& i_rRead, const std::string& i_rTarget, const VSaveLock& )
{
  return VLoad( i_rRead, i_rTarget, true ).Run();
}

} // namespace UtilsFileSystem
