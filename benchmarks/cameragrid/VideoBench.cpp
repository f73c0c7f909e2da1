// Video of many cameras to the GPU. upload: the frames alone, straight from their memory or by way of a pixel unpack
// buffer, written into textures that are then drawn from; new and same: tiles with a new frame each, or the one of
// before, through the real path of backdrop and frame. `share` is what a second carries in parts of what memcpy moves
// of the same frames.

#include "CameraGridSetup.h"

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreGraphics/ShaderResources.h>
#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreVideoUtils/VideoPlanes.h>
#include <MoxelGraphics/VRenderCameraBackdrop.h>
#include <MoxelGraphics/VSceneFrame.h>

#include <benchmark/benchmark.h>

#include <QtGui/QOpenGLExtraFunctions>

#include <chrono>
#include <cstring>

namespace
{
using namespace CameraGridBench;
using CoreMoxelTypes::EPixelFormat;
using CoreMoxelTypes::VVideoFrame;
using VBytes = std::vector< CoreMoxelTypes::u8 >;

constexpr std::uint32_t W = 1280, H = 720;
constexpr std::size_t Turns = 4; ///< frames of each camera, played in a loop

VVideoFrame MakeFrame( EPixelFormat i_Format, std::size_t i_Seed )
{
  VVideoFrame Frame;
  std::size_t Bytes = 0;
  benchmark::DoNotOptimize( CoreVideoUtils::LayOutFrame( i_Format, W, H, Frame, Bytes ).Code() );
  VBytes Data( Bytes );
  for ( std::size_t Index = 0; Index < Bytes; ++Index )
  {
    Data[Index] = static_cast< CoreMoxelTypes::u8 >( Index * 7 + i_Seed * 31 + Index / W );
  }
  Frame.Data = std::make_shared< const VBytes >( std::move( Data ) );
  return Frame;
}

/// Bytes a second that memcpy moves of that many frames of that size.
double CopyRate( std::size_t i_Frames, std::size_t i_Bytes )
{
  const std::vector< VBytes > From( i_Frames, VBytes( i_Bytes, 1 ) );
  VBytes To( i_Bytes );
  double Best = 0;
  for ( int Try = 0; Try < 5; ++Try )
  {
    const auto Start = std::chrono::steady_clock::now();
    for ( const VBytes& rFrame : From )
    {
      std::memcpy( To.data(), rFrame.data(), i_Bytes );
      benchmark::ClobberMemory();
    }
    const std::chrono::duration< double > Passed = std::chrono::steady_clock::now() - Start;
    Best = std::max( Best, static_cast< double >( i_Frames * i_Bytes ) / Passed.count() );
  }
  return Best;
}

void Tell( benchmark::State& io_rState, std::size_t i_Frames, std::size_t i_Bytes )
{
  const double Total = static_cast< double >( io_rState.iterations() ) * static_cast< double >( i_Frames * i_Bytes );
  io_rState.SetBytesProcessed( static_cast< std::int64_t >( Total ) );
  io_rState.counters["share"] =
      benchmark::Counter( Total / CopyRate( i_Frames, i_Bytes ), benchmark::Counter::kIsRate );
}

/// Textures of grey pixels, one a camera.
void Upload( benchmark::State& io_rState, bool i_bBuffer )
{
  QOpenGLExtraFunctions& rGl = *QOpenGLContext::currentContext()->extraFunctions();
  const auto Cameras = static_cast< std::size_t >( io_rState.range( 0 ) );
  constexpr std::size_t Bytes = std::size_t{ W } * H;
  std::vector< VVideoFrame > Frames;
  for ( std::size_t Index = 0; Index < Cameras * Turns; ++Index )
  {
    Frames.push_back( MakeFrame( EPixelFormat::Luminance8, Index ) );
  }
  std::vector< GLuint > Textures( Cameras );
  rGl.glGenTextures( static_cast< GLsizei >( Cameras ), Textures.data() );
  for ( const GLuint Texture : Textures )
  {
    rGl.glBindTexture( GL_TEXTURE_2D, Texture );
    rGl.glTexImage2D( GL_TEXTURE_2D, 0, GL_R8, W, H, 0, GL_RED, GL_UNSIGNED_BYTE, nullptr );
  }
  GLuint Buffer = 0;
  rGl.glGenBuffers( 1, &Buffer );
  std::size_t Turn = 0;
  for ( auto _ : io_rState )
  {
    for ( std::size_t Camera = 0; Camera < Cameras; ++Camera )
    {
      const void* pPixels = Frames[Turn * Cameras + Camera].Data->data();
      if ( i_bBuffer )
      {
        rGl.glBindBuffer( GL_PIXEL_UNPACK_BUFFER, Buffer );
        rGl.glBufferData( GL_PIXEL_UNPACK_BUFFER, Bytes, nullptr, GL_STREAM_DRAW );
        void* const pMapped =
            rGl.glMapBufferRange( GL_PIXEL_UNPACK_BUFFER, 0, Bytes, GL_MAP_WRITE_BIT | GL_MAP_INVALIDATE_BUFFER_BIT );
        std::memcpy( pMapped, pPixels, Bytes );
        rGl.glUnmapBuffer( GL_PIXEL_UNPACK_BUFFER );
        pPixels = nullptr;
      }
      rGl.glBindTexture( GL_TEXTURE_2D, Textures[Camera] );
      rGl.glTexSubImage2D( GL_TEXTURE_2D, 0, 0, 0, W, H, GL_RED, GL_UNSIGNED_BYTE, pPixels );
    }
    rGl.glBindBuffer( GL_PIXEL_UNPACK_BUFFER, 0 );
    rGl.glFinish();
    Turn = ( Turn + 1 ) % Turns;
  }
  Tell( io_rState, Cameras, Bytes );
  rGl.glDeleteBuffers( 1, &Buffer );
  rGl.glDeleteTextures( static_cast< GLsizei >( Cameras ), Textures.data() );
}

class VVideoCamera final : public ZEK::IRenderCamera
{
public:
  const std::string& GetName() const override { return Name; }
  const ComputeCameraModel::VCameraModel& GetModel() const override { return Model; }
  const std::string& GetDisplayName() const override { return Name; }
  bool GetGreyscaleFlag() const override { return false; }
  bool GetVideoFlag() const override { return false; }
  const VVideoFrame* GetVideoFrame() const override { return &Frames[Turn % Turns]; }
  void GetDrawData2D( std::uint32_t, ZEK::ECentroidColourScheme, bool, ZEK::VCameraLists2D&,
                      ZEK::VDrawWords& ) const override
  {
  }
  void GetDrawData3D( ZEK::VDrawWords&, ZEK::VCameraLists3D&, ZEK::ECentroidColourScheme ) const override {}
  const ZEK::VRenderCameraInfo& GetInfo() const override { return Info; }

  std::string Name;
  ComputeCameraModel::VCameraModel Model;
  ZEK::VRenderCameraInfo Info;
  std::vector< VVideoFrame > Frames;
  std::size_t Turn = 0;
};

class VVideoProvider final : public ZEK::IRenderCameraProvider
{
public:
  VVideoProvider( std::size_t i_Cameras, EPixelFormat i_Format )
  {
    for ( std::size_t Index = 0; Index < i_Cameras; ++Index )
    {
      auto& rpCamera = Cameras.emplace_back( std::make_shared< VVideoCamera >() );
      rpCamera->Name = CameraName( static_cast< int >( Index ) );
      rpCamera->Info.Number = static_cast< std::uint32_t >( Index );
      rpCamera->Info.SensorWidth = W;
      rpCamera->Info.SensorHeight = H;
      for ( std::size_t Turn = 0; Turn < Turns; ++Turn )
      {
        rpCamera->Frames.push_back( MakeFrame( i_Format, Index * Turns + Turn ) );
      }
      List.push_back( rpCamera );
    }
  }
  ZEK::VRenderCameraRef GetCamera( const std::string& i_rName ) const override
  {
    const auto It = std::find_if( List.begin(), List.end(),
                                  [&]( const auto& i_rpCamera )
                                  {
                                    return i_rpCamera->GetName() == i_rName;
                                  } );
    return It == List.end() ? nullptr : *It;
  }
  const std::vector< ZEK::VRenderCameraRef >& GetCameras() const override { return List; }

  std::vector< std::shared_ptr< VVideoCamera > > Cameras;
  std::vector< ZEK::VRenderCameraRef > List;
};

class VVideoScene final : public MoxelGraphics::VMoxelScene
{
public:
  explicit VVideoScene( std::shared_ptr< VVideoProvider > i_pProvider )
    : VMoxelScene( nullptr, nullptr, nullptr, nullptr, false )
    , m_pProvider( std::move( i_pProvider ) )
  {
  }
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VMoxelScene::Initialise( io_rContext );
    const auto pBackdrop = std::make_shared< MoxelGraphics::VRenderCameraBackdrop >( *this, m_pProvider );
    m_RenderList = { pBackdrop };
    m_pBackdrop = pBackdrop;
  }

private:
  std::shared_ptr< VVideoProvider > m_pProvider;
};

void Tiles( benchmark::State& io_rState, EPixelFormat i_Format, bool i_bNew )
{
  CoreGraphics::InitBasicShaderResources();
  CoreGraphics::InitSceneShaderResources();
  const int Cameras = static_cast< int >( io_rState.range( 0 ) );
  const auto pProvider = std::make_shared< VVideoProvider >( static_cast< std::size_t >( Cameras ), i_Format );
  MoxelGraphics::VSceneFrame Frame( std::make_shared< VVideoScene >( pProvider ),
                                    std::make_shared< CoreGraphics::VCameraController >() );
  Frame.Resize( { Width, Height } );
  Frame.Input().Options.CameraView = true;
  Frame.Input().Options.Show3DOverlay = false;
  Frame.Input().Tiles = MakeTiles( Cameras );
  const auto pTarget = MoxelGraphics::VSceneFrame::MakeTarget( { Width, Height }, false );
  const auto Draw = [&]
  {
    pTarget->bind();
    Frame.Render( *pTarget );
    QOpenGLContext::currentContext()->functions()->glFinish();
  };
  Draw();
  for ( auto _ : io_rState )
  {
    for ( const auto& rpCamera : pProvider->Cameras )
    {
      rpCamera->Turn += i_bNew ? 1 : 0;
    }
    Draw();
  }
  if ( i_bNew )
  {
    Tell( io_rState, static_cast< std::size_t >( Cameras ), pProvider->Cameras.front()->Frames.front().Data->size() );
  }
}

BENCHMARK_CAPTURE( Upload, plain, false )->Name( "video/upload/plain" )->Arg( 1 )->Arg( 16 )->UseRealTime();
BENCHMARK_CAPTURE( Upload, buffer, true )->Name( "video/upload/buffer" )->Arg( 1 )->Arg( 16 )->UseRealTime();
BENCHMARK_CAPTURE( Tiles, grey, EPixelFormat::Luminance8, true )
    ->Name( "video/tiles/new/luminance8" )
    ->Arg( 1 )
    ->Arg( 4 )
    ->Arg( 16 )
    ->UseRealTime();
BENCHMARK_CAPTURE( Tiles, packed, EPixelFormat::YUYV, true )->Name( "video/tiles/new/yuyv" )->Arg( 16 )->UseRealTime();
BENCHMARK_CAPTURE( Tiles, planar, EPixelFormat::NV12, true )->Name( "video/tiles/new/nv12" )->Arg( 16 )->UseRealTime();
BENCHMARK_CAPTURE( Tiles, same, EPixelFormat::Luminance8, false )
    ->Name( "video/tiles/same/luminance8" )
    ->Arg( 16 )
    ->Arg( 64 )
    ->UseRealTime();

} // namespace
