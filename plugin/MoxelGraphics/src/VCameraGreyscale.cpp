#include <MoxelGraphics/VCameraGreyscale.h>

#include "VGreyscaleBatch.h"
#include "VMaximisedGreyscale.h"

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const VVertexLayout WordLayout( 4, 1, { { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );

constexpr int TableUnit = 0, LinesUnit = 1, PixelsUnit = 2;

/// The programs of one form of the tables.
struct VPrograms
{
  VPrograms( VResources& io_rResources, EShaderForm i_Form )
    : pNormal( io_rResources.GetProgram( "Greyscale2DTiles", "Greyscale2DTiles", i_Form ) )
    , pSelection( io_rResources.GetProgram( "Greyscale2DTiles", "Greyscale2DTilesSelection", i_Form ) )
  {
  }
  std::shared_ptr< VShaderProgram > pNormal, pSelection;
};

/// What a program was last told; most frames tell it nothing new.
struct VTold
{
  std::uint64_t Link = 0;
  int FirstLine = -1, FirstPixel = -1, Show = -1;

  friend bool operator==( const VTold&, const VTold& ) = default;
};
} // namespace

struct VCameraGreyscale::VGl
{
  VGl( VMoxelScene& i_rScene, const std::shared_ptr< const ZEK::IRenderCameraProvider >& i_rpProvider )
    : rScene( i_rScene )
    , Batch( i_rpProvider )
    , Maximised( i_rScene, i_rpProvider )
  {
    State.depthTest = State.depthWrite = false;
  }
  VPrograms& Programs( bool i_bBuffers )
  {
    std::unique_ptr< VPrograms >& rpPrograms = i_bBuffers ? pBuffers : pTextures;
    if ( !rpPrograms )
    {
      rpPrograms = std::make_unique< VPrograms >( *rScene.Resources(), i_bBuffers ? EFormTextureBuffers : EFormSingle );
    }
    return *rpPrograms;
  }
  bool Draw( VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  void Tell( VShaderProgram& io_rProgram, const VTold& i_rNew );

  VMoxelScene& rScene;
  VGreyscaleBatch Batch;
  VMaximisedGreyscale Maximised;
  std::unique_ptr< VPrograms > pBuffers, pTextures;
  VUnitSquare Square;
  VRenderState State;
  std::array< VTold, 2 > Told; ///< of the programs of the visible mode and of the others
};

void VCameraGreyscale::VGl::Tell( VShaderProgram& io_rProgram, const VTold& i_rNew )
{
  VTold& rTold = Told[i_rNew.Show < 0 ? 0 : 1];
  if ( rTold == i_rNew )
  {
    return;
  }
  rTold = i_rNew;
  const auto Set = [&]( const char* i_pName, int i_Value )
  {
    io_rProgram.SetUniform( io_rProgram.UniformLocation( i_pName ), i_Value );
  };
  Set( "t_Tiles", TableUnit );
  Set( "t_Lines", LinesUnit );
  Set( "t_Pixels", PixelsUnit );
  Set( "u_FirstLine", i_rNew.FirstLine );
  Set( "u_FirstPixel", i_rNew.FirstPixel );
  Set( "u_ShowSelection", i_rNew.Show );
}

bool VCameraGreyscale::VGl::Draw( VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  VTileBatch::VDraw Range;
  if ( !Batch.Prepare( io_rContext, i_rOptions, Range ) )
  {
    return true;
  }
  VGreyscaleSet& rSet = static_cast< VGreyscaleSet& >( *Range.pSet );
  const int Mode = io_rContext.RenderMode();
  const bool bVisible = Mode == ERenderModeNormal;
  VPrograms& rPrograms = Programs( rSet.Pixels.IsBuffer() );
  const auto& rpProgram = bVisible ? rPrograms.pNormal : rPrograms.pSelection;
  if ( !io_rContext.UseProgram( rpProgram ) )
  {
    return true;
  }
  if ( !bVisible && !Batch.WriteWords( rSet, rScene, i_rOptions.CentroidColourScheme ) )
  {
    return false;
  }
  const std::array< VVertexStream, 3 > Streams{
      VVertexStream{ &rSet.Records, &VGreyscaleBatch::RecordLayout(), Range.First * VGreyscaleBatch::RecordBytes },
      Square.Stream(), VVertexStream{ &rSet.Words, &WordLayout, Range.First * sizeof( std::uint32_t ) } };
  if ( !Range.pTable->Bind( io_rContext, TableUnit ) || !rSet.Lines.Bind( io_rContext, LinesUnit ) ||
       !rSet.Pixels.Bind( io_rContext, PixelsUnit ) ||
       !io_rContext.SetVertexStreams( std::span( Streams ).first( bVisible ? 2 : 3 ) ) )
  {
    return false;
  }
  Tell( *rpProgram, { rpProgram->LinkSerial(), rSet.Lines.First(), rSet.Pixels.First(),
                      bVisible ? -1 : ( Mode == ERenderModeHighlight ? 1 : 0 ) } );
  io_rContext.SetRenderState( State );
  io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, static_cast< int >( Range.End - Range.First ) );
  return true;
}

VCameraGreyscale::VCameraGreyscale( VMoxelScene& i_rScene,
                                    std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_pGl( std::make_unique< VGl >( i_rScene, i_pProvider ) )
{
}

VCameraGreyscale::~VCameraGreyscale() = default;

void VCameraGreyscale::Collect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  if ( !i_rOptions.CameraView || !i_rOptions.CameraGreyscale || i_rOptions.OverlayCamera.isEmpty() )
  {
    return;
  }
  i_rOptions.CameraMaximiseGreyscale ? m_pGl->Maximised.Collect( io_rContext, i_rOptions )
                                     : m_pGl->Batch.Collect( io_rContext, i_rOptions );
}

void VCameraGreyscale::DrawTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  VGl& rGl = *m_pGl;
  if ( io_rContext.RenderMode() == ERenderModeHighlight && !HasMarks( rGl.rScene, ZEK::ESelectGreyscaleBlob ) )
  {
    rGl.Batch.Forget();
    rGl.Maximised.Forget();
    return;
  }
  if ( rGl.rScene.TilesAgain() )
  {
    rGl.Batch.Again();
    rGl.Maximised.Again();
  }
  if ( !rGl.Draw( io_rContext, i_rOptions ) )
  {
    // The buffers may have died with the windows that shared them.
    rGl.Batch.Invalidate();
    rGl.Batch.Again();
    rGl.Draw( io_rContext, i_rOptions );
  }
  rGl.Maximised.DrawTiles( io_rContext, i_rOptions );
}

} // namespace MoxelGraphics
