#include "CameraViewFixture.h"

#include <CoreGraphics/VTexelBuffer.h>
#include <ZEK/Log.h>

// What tiles and frustums take to the device, and what it does not take.

namespace FlowTest
{
namespace
{
class VCameraBuffers : public VCameraView
{
protected:
  VCameraBuffers() { ZEK::GlobalLog().AddSink( m_pLog ); }
  ~VCameraBuffers() override { ZEK::GlobalLog().RemoveSink( m_pLog ); }

  std::uint64_t Uploaded() const { return pFrame->Figures().BytesUploaded; }
  std::ptrdiff_t Said( const char* i_pText ) const
  {
    const std::vector< ZEK::VLogLine > Lines = m_pLog->Lines();
    return std::count_if( Lines.begin(), Lines.end(),
                          [&]( const ZEK::VLogLine& i_rLine )
                          {
                            return i_rLine.Text.find( i_pText ) != std::string::npos;
                          } );
  }
  QImage Nothing( const QImage& i_rLike ) const
  {
    QImage None( 300, 383, i_rLike.format() );
    None.fill( QColor( Empty ) );
    return None;
  }

private:
  std::shared_ptr< ZEK::VLogRing > m_pLog = std::make_shared< ZEK::VLogRing >();
};
} // namespace

TEST_F( VCameraBuffers, APointerOverATileCostsEachNewStateThatTilesObjectsAndNothingOfTheOthers )
{
  Make( Looks[0] );
  const auto Next = [&]( bool i_bPointer )
  {
    const auto Step = 10 + 0.125F * static_cast< float >( Number );
    ShowAll( { Item< FlowCentroidSet >( Centroids( 60, Step ) ),
               Item< FlowCentroidSet >( Centroids( 20, Step ), "camera:2" ) } );
    i_bPointer ? void( Pick( { 5, 5 }, { 5, 5 }, MoxelGraphics::EPickHover ) ) : void( Draw() );
    return Uploaded();
  };
  std::uint64_t Without = 0, With = 0;
  for ( int Times = 0; Times < 3; ++Times )
  {
    Without = Next( false );
  }
  // The pointer comes while the state stands, and finds all in the buffers of the others.
  Pick( { 5, 5 }, { 5, 5 }, MoxelGraphics::EPickHover );
  EXPECT_EQ( Uploaded(), 2 * 32768 + 80 * sizeof( std::uint32_t ) ) << "a table a kind, and the words of all";
  for ( int Times = 0; Times < 3; ++Times )
  {
    With = Next( true );
  }
  EXPECT_EQ( Without, 80 * sizeof( ZEK::VCentroidVertex ) );
  EXPECT_EQ( With, Without + 60 * ( sizeof( ZEK::VCentroidVertex ) + sizeof( std::uint32_t ) ) );
}

TEST_F( VCameraBuffers, SelectionWordsAreWrittenOnceAState )
{
  for ( const bool bPlanes : { false, true } )
  {
    Make( Looks[0] );
    VCentroidSet Set;
    Set.Centroids = { { 200, 300, 3 }, { 1000, 800, 3 } };
    ShowAll( { Item< FlowCentroidSet >( Set ), Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 40 ) ) } );
    Options().CameraMaximiseGreyscale = true;
    Options().CameraView = !bPlanes;
    Options().Cameras = bPlanes;
    Options().Show3DOverlay = bPlanes;
    QImage Plain, Marked;
    for ( const bool bMarked : { false, true } )
    {
      pScene->Select(
          bMarked ? ZEK::VSelection{ { ZEK::ESelectCentroid, Name, 0, 1 }, { ZEK::ESelectGreyscaleBlob, Name, 0, 0 } }
                  : ZEK::VSelection{} );
      for ( int Times = 0; Times < 3; ++Times )
      {
        Pick( { 5, 5 }, { 5, 5 }, MoxelGraphics::EPickHover );
      }
      EXPECT_EQ( Uploaded(), 0u ) << bPlanes << bMarked;
      ( bMarked ? Marked : Plain ) = Draw();
    }
    EXPECT_NE( Marked, Plain ) << "what is selected is written all the same";
    TearDown();
  }
}

TEST_F( VCameraBuffers, ASensorWiderThanATextureIsNotMaximisedAndThatIsSaidOnce )
{
  Make( Looks[0] );
  Options().CameraMaximiseGreyscale = true;
  VCameraHardware Wide = Hardware();
  Wide.SensorWidth = 65536;
  QImage Picture;
  for ( int Times = 0; Times < 3; ++Times )
  {
    Show( { Item< FlowCameraHardware >( Wide ), Item< FlowCameraHardware >( Hardware(), "camera:2" ),
            Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 40 ) ),
            Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 40 ), "camera:2" ) } );
    Draw();
    Picture = Draw();
  }
  EXPECT_EQ( Picture.copy( 0, 0, 300, 383 ), Nothing( Picture ) );
  EXPECT_NE( Picture.copy( 300, 0, 300, 383 ), Nothing( Picture ) );
  EXPECT_EQ( Said( "cannot be maximised" ), 1 );
}

TEST_F( VCameraBuffers, GreyBeyondTheDeviceIsLeftOutAndThatIsSaidOnce )
{
  using namespace CoreGraphics;
  Make( Looks[0] );
  ShowAll( {} );
  Draw();
  pOffscreen->MakeCurrent();
  VRenderContext& rContext = *pFrame->Context();
  std::size_t Bytes = VTexelBuffer::MostTextureBytes( rContext, ETexelByte ) + 1;
  while ( VTexelBuffer::Fits( rContext, ETexelByte, Bytes ) )
  {
    Bytes *= 2;
  }
  if ( Bytes > 200'000'000 )
  {
    GTEST_SKIP() << "a device that holds more than a test should fill";
  }
  VGreyscaleBlobSet Huge = Blobs( 300, 300, 90 );
  Huge.Pixels.resize( Bytes, 128 );
  const VFlowItemRef Large = Item< FlowGreyscaleBlobSet >( Huge );
  QImage Picture;
  for ( int Times = 0; Times < 2; ++Times )
  {
    ShowAll( { Large, Item< FlowGreyscaleBlobSet >( Blobs( 300 + Times, 300, 90 ), "camera:2" ) } );
    Picture = Draw();
    EXPECT_LT( Uploaded(), 1'000'000u );
    Draw();
    EXPECT_EQ( Uploaded(), 0u ) << "what was refused is not tried again";
  }
  EXPECT_EQ( Picture.copy( 0, 0, 300, 383 ), Nothing( Picture ) );
  EXPECT_NE( Picture.copy( 300, 0, 300, 383 ), Nothing( Picture ) );
  EXPECT_EQ( Said( "more than the device holds" ), 1 );
}

} // namespace FlowTest
