#include <HostMeshes/ReadMesh.h>

#include "MeshBytes.h"

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QProcess>

namespace HostMeshes
{
namespace
{
constexpr int LongestReading = 45'000;                          // ms; less than a picture waits for its meshes
constexpr int LookEvery = 50;                                   // ms
constexpr std::size_t LargestOutcome = std::size_t{ 1 } << 30u; // bytes
} // namespace

ZEK::IResult ReadMeshApart( const std::filesystem::path& i_rReader, const std::filesystem::path& i_rPath,
                            HarrowPluginInterface::VMeshScene& o_rMesh, std::string& o_rMessage,
                            const std::atomic< bool >* i_pStop )
{
  o_rMesh = {};
  const auto Fail = [&]( const std::string& i_rReason )
  {
    o_rMessage = i_rPath.filename().string() + ": " + i_rReason;
    return ZEK::IResult::InvalidFormat;
  };
  QProcess Process;
  Process.setStandardInputFile( QProcess::nullDevice() );
  Process.setStandardErrorFile( QProcess::nullDevice() );
  Process.start( QString::fromStdU16String( i_rReader.u16string() ),
                 { QString::fromStdU16String( std::filesystem::absolute( i_rPath ).u16string() ) } );
  if ( !Process.waitForStarted() )
  {
    return Fail( "the program that reads meshes does not start" );
  }
  QElapsedTimer Since;
  Since.start();
  while ( !Process.waitForFinished( LookEvery ) && Process.state() != QProcess::NotRunning )
  {
    const bool bStop = i_pStop && *i_pStop;
    if ( bStop || Since.hasExpired( LongestReading ) )
    {
      Process.kill();
      Process.waitForFinished();
      return Fail( bStop ? "nobody waits for it any more" : "it takes too long" );
    }
  }
  const QByteArray Bytes = Process.readAllStandardOutput();
  VMeshOutcome Outcome;
  if ( Process.exitStatus() != QProcess::NormalExit || Process.exitCode() != 0 ||
       !UnpackOutcome( std::as_bytes( std::span( Bytes.constData(), static_cast< std::size_t >( Bytes.size() ) ) ),
                       Outcome ) )
  {
    return Fail( "it is so broken that reading it failed" );
  }
  o_rMessage = std::move( Outcome.Message );
  o_rMesh = std::move( Outcome.Mesh );
  return Outcome.bRead ? ZEK::IResult::Ok : ZEK::IResult::InvalidFormat;
}

std::filesystem::path FindMeshReader()
{
  const std::filesystem::path Folder = QCoreApplication::applicationDirPath().toStdU16String();
  std::error_code Error;
  const std::filesystem::path Reader = Folder / "harrow-mesh-reader";
  return std::filesystem::is_regular_file( Reader, Error ) ? Reader : std::filesystem::path();
}

int RunMeshReader( const std::filesystem::path& i_rPath, std::FILE* io_pOutput )
{
  VMeshOutcome Outcome;
  Outcome.bRead = ReadMesh( i_rPath, Outcome.Mesh, Outcome.Message ).IsOk();
  std::vector< std::byte > Bytes = PackOutcome( Outcome );
  if ( Bytes.size() > LargestOutcome )
  {
    Outcome = {};
    Outcome.Message = i_rPath.filename().string() + ": it is too large to be shown";
    Bytes = PackOutcome( Outcome );
  }
  return std::fwrite( Bytes.data(), 1, Bytes.size(), io_pOutput ) == Bytes.size() && std::fflush( io_pOutput ) == 0 ? 0
                                                                                                                    : 1;
}

} // namespace HostMeshes
