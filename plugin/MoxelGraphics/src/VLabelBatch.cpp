#include <MoxelGraphics/VLabelBatch.h>

#include "LabelChoice.h"
#include "VGlyphSheet.h"

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>
#include <CoreGraphics/VVertexBuffer.h>

#include <algorithm>
#include <chrono>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr int SheetUnit = 0;
constexpr int SmallestPixels = 6, LargestPixels = 128;
constexpr std::size_t MostSheets = 3;

constexpr float FadeSeconds = 0.25f;
/// A view that did not draw for so long is looked at anew.
constexpr double LongestPause = 1.0;
/// The part of the distance in which labels fade.
constexpr float FadingPart = 0.15f;

constexpr std::uint32_t MarkedColour = 0xFF409EFF; // 0xAABBGGRR

struct VGlyphInstance
{
  std::int16_t Place[4];
  std::uint16_t Sheet[2];
  std::uint32_t Colour;
};
const VVertexLayout GlyphLayout( sizeof( VGlyphInstance ), 1,
                                 { { EAttributePosition, 4, GL_SHORT, false, 0 },
                                   { EAttributeUV, 2, GL_UNSIGNED_SHORT, false, 8 },
                                   { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
static_assert( sizeof( VGlyphInstance ) == 16 );

double SteadySeconds()
{
  return std::chrono::duration< double >( std::chrono::steady_clock::now().time_since_epoch() ).count();
}
} // namespace

/// The texts at one size.
struct VLabelBatch::VSheet
{
  VSheet( int i_Pixels, std::uint64_t i_Serial )
    : Glyphs( i_Pixels )
    , Serial( i_Serial )
  {
  }
  /// From the label's place to the start of its baseline, pixels, y down.
  int OffsetX( std::size_t i_Label, ELabelPlace i_Place ) const
  {
    return i_Place == ELabelPlace::Above ? -Layouts[i_Label].Width / 2 : 0;
  }
  int OffsetY( ELabelPlace i_Place ) const
  {
    return i_Place == ELabelPlace::Above ? -Glyphs.Descent() : ( Glyphs.Ascent() - Glyphs.Descent() ) / 2;
  }

  VGlyphSheet Glyphs;
  const std::uint64_t Serial;         ///< a sheet that is made again has its glyphs elsewhere
  std::vector< VTextLayout > Layouts; ///< by label
  std::uint64_t Generation = 0;       ///< of the texts
};

struct VLabelBatch::VView
{
  struct VKey
  {
    std::uint64_t Texts = 0, Points = 0, Sheet = 0;
    VLabelStyle Style;
    QSize Viewport;
    QMatrix4x4 ViewProjection;
    friend bool operator==( const VKey&, const VKey& ) = default;
  };

  VKey Key;
  double Time = 0;
  bool bFading = false;
  VLabelChoice Choice;
  std::vector< VLabelCandidate > Candidates;
  std::vector< float > Strengths; ///< by label
  std::vector< VLabelCandidate > Shown;
  bool bWritten = false; ///< the buffer holds what is shown
  int Instances = 0;
  VDynamicBuffer Glyphs;
};

struct VLabelBatch::VGl
{
  std::shared_ptr< VShaderProgram > pProgram;
  VRenderState State;
  VUniform Sheet{ "t_Texture" };
};

VLabelBatch::VLabelBatch( std::shared_ptr< CoreGraphics::VResources > i_pResources )
  : m_Clock( SteadySeconds )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_pResources->GetProgram( "Label", "Label" );
  m_pGl->State.colourBlend = EColourBlendPremultiplied;
  m_pGl->State.depthTest = false;
  m_pGl->State.depthWrite = false;
}

VLabelBatch::~VLabelBatch() = default;

void VLabelBatch::SetTexts( std::vector< VLabelText > i_Texts )
{
  m_Texts = std::move( i_Texts );
  m_Points.assign( m_Texts.size(), {} );
  ++m_TextsGeneration;
}

std::uint64_t VLabelBatch::LaidOut() const
{
  std::uint64_t Count = 0;
  for ( const auto& rpSheet : m_Sheets )
  {
    Count += rpSheet->Glyphs.LaidOut();
  }
  return Count;
}

VLabelBatch::VView& VLabelBatch::ViewOf( CoreGraphics::VRenderContext& io_rContext ) const
{
  std::shared_ptr< void >& rpView = io_rContext.Belonging( this );
  if ( !rpView )
  {
    rpView = std::make_shared< VView >();
  }
  return *static_cast< VView* >( rpView.get() );
}

std::vector< float > VLabelBatch::Strengths( CoreGraphics::VRenderContext& io_rContext ) const
{
  return ViewOf( io_rContext ).Strengths;
}

VLabelBatch::VSheet& VLabelBatch::SheetOf( int i_Pixels )
{
  const auto Found = std::find_if( m_Sheets.begin(), m_Sheets.end(),
                                   [&]( const auto& i_rpSheet )
                                   {
                                     return i_rpSheet->Glyphs.Pixels() == i_Pixels;
                                   } );
  if ( Found == m_Sheets.end() )
  {
    if ( m_Sheets.size() == MostSheets )
    {
      m_Sheets.pop_back();
    }
    m_Sheets.insert( m_Sheets.begin(), std::make_unique< VSheet >( i_Pixels, ++m_SheetSerial ) );
  }
  else
  {
    std::rotate( m_Sheets.begin(), Found, Found + 1 );
  }
  VSheet& rSheet = *m_Sheets.front();
  if ( rSheet.Generation != m_TextsGeneration )
  {
    rSheet.Generation = m_TextsGeneration;
    rSheet.Layouts.clear();
    for ( const VLabelText& rText : m_Texts )
    {
      rSheet.Layouts.push_back( rSheet.Glyphs.Layout( rText.Text, rText.bName ) );
    }
  }
  return rSheet;
}

bool VLabelBatch::IsWanted( std::size_t i_Label, std::uint32_t i_Switches ) const
{
  const VLabelText& rText = m_Texts[i_Label];
  if ( !m_Points[i_Label].bShown || ( rText.Needs & ~i_Switches ) != 0 )
  {
    return false;
  }
  const auto Other = static_cast< std::size_t >( rText.Unless );
  return Other >= m_Points.size() || !m_Points[Other].bShown || ( rText.UnlessNeeds & ~i_Switches ) != 0;
}

void VLabelBatch::Choose( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
                          const VLabelStyle& i_rStyle ) const
{
  const QSize Viewport = io_rContext.Viewport().size();
  const QMatrix4x4& rM = io_rContext.ViewProjection();
  const QVector3D Eye = io_rContext.CameraPosition();
  const bool bPerspective = io_rContext.Projection()( 3, 3 ) == 0.0F;
  const float PixelsAtOne = io_rContext.Projection()( 1, 1 ) * static_cast< float >( Viewport.height() ) / 2;
  const float Distance = bPerspective && i_rStyle.Distance > 0 ? i_rStyle.Distance : 0;
  const float HalfWidth = static_cast< float >( Viewport.width() ) / 2;
  const float HalfHeight = static_cast< float >( Viewport.height() ) / 2;
  const auto Gap = static_cast< float >( i_rSheet.Glyphs.Pixels() ) / 4;
  const auto Row = [&rM]( int i_Row, const VLabelPoint& i_rPoint )
  {
    return rM( i_Row, 0 ) * i_rPoint.X + rM( i_Row, 1 ) * i_rPoint.Y + rM( i_Row, 2 ) * i_rPoint.Z + rM( i_Row, 3 );
  };
  io_rView.Candidates.clear();
  for ( std::size_t Index = 0; Index < m_Points.size(); ++Index )
  {
    const VLabelPoint& rPoint = m_Points[Index];
    const VTextLayout& rLayout = i_rSheet.Layouts[Index];
    const float W = Row( 3, rPoint );
    if ( rLayout.Count == 0 || !( W > 0.5F ) || !IsWanted( Index, i_rStyle.Switches ) )
    {
      continue;
    }
    const float X = Row( 0, rPoint ) / W, Y = Row( 1, rPoint ) / W;
    if ( !( std::abs( X ) <= 1 && std::abs( Y ) <= 1 ) )
    {
      continue;
    }
    const float Away =
        bPerspective ? ( QVector3D( rPoint.X, rPoint.Y, rPoint.Z ) - Eye ).length() : Row( 2, rPoint ) + 2;
    const float Strength =
        Distance > 0 ? std::clamp( ( Distance - Away ) / ( Distance * FadingPart ), 0.0F, 1.0F ) : 1.0F;
    if ( !( Strength > 0 ) )
    {
      continue;
    }
    const VLabelText& rText = m_Texts[Index];
    VLabelCandidate New;
    New.Label = static_cast< std::uint32_t >( Index );
    New.Rank = rPoint.bMarked ? 0 : rText.bName ? 1 : 2;
    New.bHeld = io_rView.Strengths[Index] > 0;
    New.Away = Away;
    New.Strength = Strength;
    const float Beside = rText.Place == ELabelPlace::Beside ? rPoint.Radius * PixelsAtOne / W + Gap : 0;
    New.X = std::floor( ( X + 1 ) * HalfWidth + Beside + 0.5F );
    New.Y = std::floor( ( Y + 1 ) * HalfHeight + 0.5F );
    const int Left = i_rSheet.OffsetX( Index, rText.Place ), Baseline = -i_rSheet.OffsetY( rText.Place );
    New.Left = static_cast< std::int16_t >( Left );
    New.Right = static_cast< std::int16_t >( Left + rLayout.Width );
    New.Bottom = static_cast< std::int16_t >( Baseline - i_rSheet.Glyphs.Descent() );
    New.Top = static_cast< std::int16_t >( Baseline + i_rSheet.Glyphs.Ascent() );
    io_rView.Candidates.push_back( New );
  }
  io_rView.Choice.Choose( io_rView.Candidates, i_rStyle.Limit, Viewport );
}

void VLabelBatch::Fade( VView& io_rView, float i_Step ) const
{
  io_rView.bFading = false;
  io_rView.Shown.clear();
  std::size_t Next = 0;
  for ( VLabelCandidate& rCandidate : io_rView.Candidates )
  {
    for ( ; Next < rCandidate.Label; ++Next )
    {
      io_rView.Strengths[Next] = 0; // out of sight
    }
    float& rStrength = io_rView.Strengths[Next++];
    const float Goal = rCandidate.bChosen ? rCandidate.Strength : 0.0F;
    rStrength = std::clamp( Goal, rStrength - i_Step, rStrength + i_Step );
    io_rView.bFading = io_rView.bFading || rStrength != Goal;
    if ( rStrength > 0 )
    {
      rCandidate.Strength = rStrength;
      io_rView.Shown.push_back( rCandidate );
    }
  }
  std::fill( io_rView.Strengths.begin() + static_cast< std::ptrdiff_t >( Next ), io_rView.Strengths.end(), 0.0F );
}

bool VLabelBatch::Write( VView& io_rView, const VSheet& i_rSheet ) const
{
  std::size_t Count = 0;
  for ( const VLabelCandidate& rShown : io_rView.Shown )
  {
    Count += i_rSheet.Layouts[rShown.Label].Count;
  }
  auto* pInstance = static_cast< VGlyphInstance* >( io_rView.Glyphs.Map( Count * sizeof( VGlyphInstance ) ) );
  if ( !pInstance )
  {
    return false;
  }
  for ( const VLabelCandidate& rShown : io_rView.Shown )
  {
    const VTextLayout& rLayout = i_rSheet.Layouts[rShown.Label];
    const VLabelText& rText = m_Texts[rShown.Label];
    const std::uint32_t Own = m_Points[rShown.Label].bMarked ? MarkedColour : rText.Colour;
    const std::uint32_t Colour = ( Own & 0xFFFFFF ) | static_cast< std::uint32_t >( rShown.Strength * 255 ) << 24;
    const int X = static_cast< int >( rShown.X ) + i_rSheet.OffsetX( rShown.Label, rText.Place );
    const int Y = static_cast< int >( rShown.Y ) - i_rSheet.OffsetY( rText.Place );
    const VPlacedGlyph* pGlyph = i_rSheet.Glyphs.Glyphs( rLayout );
    for ( const VPlacedGlyph* const pEnd = pGlyph + rLayout.Count; pGlyph != pEnd; ++pGlyph )
    {
      *pInstance++ = {
          { static_cast< std::int16_t >( X + pGlyph->X ), static_cast< std::int16_t >( Y - pGlyph->Y ), pGlyph->Width,
            pGlyph->Height },
          { static_cast< std::uint16_t >( pGlyph->SheetX ), static_cast< std::uint16_t >( pGlyph->SheetY ) },
          Colour };
    }
  }
  io_rView.Instances = static_cast< int >( Count );
  return io_rView.Glyphs.Unmap();
}

void VLabelBatch::Draw( CoreGraphics::VRenderContext& io_rContext, const VLabelStyle& i_rStyle, bool i_bSettled )
{
  if ( m_Texts.empty() || i_rStyle.Limit <= 0 )
  {
    return;
  }
  const float Wanted = static_cast< float >( i_rStyle.Pixels ) * io_rContext.PixelRatio();
  const int Pixels = std::clamp( static_cast< int >( std::lround( Wanted ) ), SmallestPixels, LargestPixels );
  VSheet& rSheet = SheetOf( Pixels );
  VView& rView = ViewOf( io_rContext );
  const VView::VKey Key{
      m_TextsGeneration,           m_PointsGeneration, rSheet.Serial, i_rStyle, io_rContext.Viewport().size(),
      io_rContext.ViewProjection() };
  if ( rView.bFading || !( Key == rView.Key ) )
  {
    const double Now = m_Clock();
    const bool bAnew =
        Key.Texts != rView.Key.Texts || Key.Sheet != rView.Key.Sheet || !( Key.Style == rView.Key.Style );
    const double Passed = Now - rView.Time;
    const bool bAtOnce = i_bSettled || bAnew || Passed < 0 || Passed > LongestPause;
    if ( bAnew )
    {
      rView.Strengths.assign( m_Texts.size(), 0 );
    }
    rView.Key = Key;
    rView.bWritten = false;
    Choose( io_rContext, rView, rSheet, i_rStyle );
    Fade( rView, bAtOnce ? 1.0F : static_cast< float >( Passed ) / FadeSeconds );
  }
  rView.Time = m_Clock();
  if ( rView.Shown.empty() )
  {
    return;
  }
  // A second try is for a buffer that died with its windows.
  rView.bWritten = ( rView.bWritten && rView.Glyphs.Bind() ) || Write( rView, rSheet );
  if ( !rView.bWritten || !rSheet.Glyphs.Bind( io_rContext, SheetUnit ) || !io_rContext.UseProgram( m_pGl->pProgram ) ||
       !io_rContext.SetVertexBuffer( { &rView.Glyphs, &GlyphLayout, 0 } ) )
  {
    return;
  }
  io_rContext.SetRenderState( m_pGl->State );
  m_pGl->Sheet.Set( *m_pGl->pProgram, SheetUnit );
  io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, rView.Instances );
}

} // namespace MoxelGraphics
