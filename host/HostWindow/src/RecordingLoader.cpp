#include <HostWindow/RecordingLoader.h>

#include <HostSources/ReadRecording.h>

#include <utility>

namespace HostWindow
{

struct VRecordingLoader::VJob
{
  QString Path;
  VRecordingLoader* pLoader = nullptr; ///< null once it is given up; GUI thread
  std::atomic< bool > bCancel{ false };
  std::shared_ptr< HostSources::VRecording > pRecording = std::make_shared< HostSources::VRecording >();
  std::string Message;
  ZEK::IResult Result;
};

VRecordingLoader::VRecordingLoader( std::shared_ptr< ZEK::IPostalService > i_pPostal,
                                    HostSources::VReadOptions i_Reading, QObject* i_pParent )
  : QObject( i_pParent )
  , m_pPostal( std::move( i_pPostal ) )
  , m_Reading( std::move( i_Reading ) )
{
}

VRecordingLoader::~VRecordingLoader()
{
  Abandon();
}

void VRecordingLoader::Abandon()
{
  if ( m_pJob )
  {
    m_pJob->bCancel = true;
    m_pJob->pLoader = nullptr;
  }
  m_pJob.reset();
  if ( m_Thread.joinable() )
  {
    m_Thread.join();
  }
}

void VRecordingLoader::Load( const QString& i_rPath )
{
  Abandon();
  m_pJob = std::make_shared< VJob >();
  m_pJob->Path = i_rPath;
  m_pJob->pLoader = this;
  m_Thread = std::thread(
      [pPostal = m_pPostal, pJob = m_pJob, Reading = m_Reading]
      {
        int LastPercent = -1;
        const auto OnProgress = [&]( double i_Fraction )
        {
          const int Percent = static_cast< int >( i_Fraction * 100 );
          if ( Percent != LastPercent )
          {
            LastPercent = Percent;
            pPostal->Post(
                [pJob, i_Fraction]
                {
                  if ( pJob->pLoader != nullptr )
                  {
                    emit pJob->pLoader->Progress( pJob->Path, i_Fraction );
                  }
                } );
          }
          return !pJob->bCancel;
        };
        pJob->Result = HostSources::ReadRecording( pJob->Path.toStdString(), *pJob->pRecording, pJob->Message,
                                                   OnProgress, Reading );
        pPostal->Post(
            [pJob]
            {
              if ( pJob->pLoader != nullptr )
              {
                pJob->pLoader->Finish( pJob );
              }
            } );
      } );
}

void VRecordingLoader::Cancel()
{
  if ( m_pJob )
  {
    m_pJob->bCancel = true;
  }
}

void VRecordingLoader::Finish( const std::shared_ptr< VJob >& i_rpJob )
{
  m_Thread.join();
  m_pJob.reset();
  const QString Message = QString::fromStdString( i_rpJob->Message );
  if ( i_rpJob->Result.IsError() )
  {
    emit Failed( i_rpJob->Path, Message, i_rpJob->Result.Code() );
    return;
  }
  emit Loaded( i_rpJob->Path, i_rpJob->pRecording, Message );
}

} // namespace HostWindow
