#include <MoxelGraphics/VLabelBatch.h>

#include "LabelChoice.h"
#include "VGlyphSheet.h"

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>
#include <CoreGraphics/VVertexBuffer.h>

#include <algorithm>
#include <array>
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
/// Which labels are shown is chosen so often while something moves; in between those that are shown move.
constexpr double ChoiceSeconds = 0.2 - 1e-4;
/// A view that did not draw for so long is looked at anew.
constexpr double LongestPause = 1.0;
/// The part of the distance in which labels fade.
constexpr float FadingPart = 0.15f;

constexpr std::uint32_t MarkedColour = 0xFF409EFF; // 0xAABBGGRR

/// A piece of a text in the view and in the sheet: so little is written that it hardly costs memory.
struct VPieceInstance
{
  std::int16_t Place[4];
  std::int16_t Sheet[2];
  std::uint32_t Colour;
};
const VVertexLayout PieceLayout( sizeof( VPieceInstance ), 1,
                                 { { EAttributePosition, 4, GL_SHORT, false, 0 },
                                   { EAttributeUV, 2, GL_SHORT, false, 8 },
                                   { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
static_assert( sizeof( VPieceInstance ) == 16 );

/// Where points of the world are in a view, pixels from its lower left.
class VSight
{
public:
  VSight( VRenderContext& io_rContext, int i_Gap )
    : m_PixelsAtOne( io_rContext.Projection()( 1, 1 ) * static_cast< float >( io_rContext.Viewport().height() ) / 2 )
    , m_HalfWidth( static_cast< float >( io_rContext.Viewport().width() ) / 2 )
    , m_HalfHeight( static_cast< float >( io_rContext.Viewport().height() ) / 2 )
    , m_Gap( static_cast< float >( i_Gap ) / 4 + 0.5F )
  {
    std::copy_n( io_rContext.ViewProjection().constData(), m_M.size(), m_M.begin() );
  }
  float Row( std::size_t i_Row, const VLabelPoint& i_rPoint ) const
  {
    return m_M[i_Row] * i_rPoint.X + m_M[4 + i_Row] * i_rPoint.Y + m_M[8 + i_Row] * i_rPoint.Z + m_M[12 + i_Row];
  }
  /// False where the point is not to be seen.
  bool See( const VLabelPoint& i_rPoint, bool i_bBeside, std::int32_t& o_rX, std::int32_t& o_rY ) const
  {
    const float W = Row( 3, i_rPoint );
    const float X = Row( 0, i_rPoint ), Y = Row( 1, i_rPoint );
    if ( !( W > 0.5F && std::abs( X ) <= W && std::abs( Y ) <= W ) )
    {
      return false;
    }
    const float Part = 1 / W;
    const float Radius = i_rPoint.Radius * m_PixelsAtOne * Part;
    const float Beside = i_bBeside ? ( Radius < LargestRadius ? Radius : 0 ) + m_Gap : 0.5F;
    o_rX = static_cast< std::int32_t >( ( X * Part + 1 ) * m_HalfWidth + Beside );
    o_rY = static_cast< std::int32_t >( ( Y * Part + 1 ) * m_HalfHeight + 0.5F );
    return true;
  }

private:
  static constexpr float LargestRadius = 1 << 13; // pixels

  std::array< float, 16 > m_M{};
  const float m_PixelsAtOne, m_HalfWidth, m_HalfHeight, m_Gap;
};

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
    std::uint64_t Texts = 0, Points = 0, Marks = 0, Sheet = 0;
    VLabelStyle Style;
    QSize Viewport;
    QMatrix4x4 ViewProjection;
    friend bool operator==( const VKey&, const VKey& ) = default;
  };

  struct VShown
  {
    std::uint32_t Label = 0;
    std::int32_t X = 0, Y = 0; ///< the label's place, pixels from the lower left
    float Goal = 0;            ///< the strength that its own goes to
  };

  VKey Key;
  double Time = 0;
  double ChosenAt = 0;
  bool bUnsettled = false; ///< something fades, or moved since labels were chosen
  VLabelChoice Choice;
  std::vector< VLabelCandidate > Candidates;
  std::vector< float > Strengths; ///< by label
  std::vector< VShown > Shown;
  bool bWritten = false; ///< the buffer holds what is shown
  int Instances = 0;
  VDynamicBuffer Pieces;
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
  m_Traits.clear();
  for ( const VLabelText& rText : m_Texts )
  {
    m_Traits.push_back(
        { rText.Needs, rText.Unless, rText.UnlessNeeds, rText.bName, rText.Place == ELabelPlace::Beside } );
  }
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
  const VTrait& rTrait = m_Traits[i_Label];
  if ( !m_Points[i_Label].bShown || ( rTrait.Needs & ~i_Switches ) != 0 )
  {
    return false;
  }
  const auto Other = static_cast< std::size_t >( rTrait.Unless );
  return Other >= m_Points.size() || !m_Points[Other].bShown || ( rTrait.UnlessNeeds & ~i_Switches ) != 0;
}

void VLabelBatch::Choose( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
                          const VLabelStyle& i_rStyle ) const
{
  const VSight Sight( io_rContext, i_rSheet.Glyphs.Pixels() );
  const QVector3D Eye = io_rContext.CameraPosition();
  const bool bPerspective = io_rContext.Projection()( 3, 3 ) == 0.0F;
  const float Distance = bPerspective && i_rStyle.Distance > 0 ? i_rStyle.Distance : 0;
  io_rView.Candidates.clear();
  for ( std::size_t Index = 0; Index < m_Points.size(); ++Index )
  {
    const VLabelPoint& rPoint = m_Points[Index];
    const VTextLayout& rLayout = i_rSheet.Layouts[Index];
    const VTrait& rTrait = m_Traits[Index];
    VLabelCandidate New;
    if ( rLayout.Count == 0 || !IsWanted( Index, i_rStyle.Switches ) ||
         !Sight.See( rPoint, rTrait.bBeside, New.X, New.Y ) )
    {
      continue;
    }
    New.Away = bPerspective ? ( QVector3D( rPoint.X, rPoint.Y, rPoint.Z ) - Eye ).length() : Sight.Row( 2, rPoint ) + 2;
    New.Strength = Distance > 0 ? std::clamp( ( Distance - New.Away ) / ( Distance * FadingPart ), 0.0F, 1.0F ) : 1.0F;
    if ( !( New.Strength > 0 ) )
    {
      continue;
    }
    New.Label = static_cast< std::uint32_t >( Index );
    New.Rank = rPoint.bMarked ? 0 : rTrait.bName ? 1 : 2;
    New.bHeld = io_rView.Strengths[Index] > 0;
    const ELabelPlace Place = rTrait.bBeside ? ELabelPlace::Beside : ELabelPlace::Above;
    const int Left = i_rSheet.OffsetX( Index, Place ), Baseline = -i_rSheet.OffsetY( Place );
    New.Left = static_cast< std::int16_t >( Left );
    New.Right = static_cast< std::int16_t >( Left + rLayout.Width );
    New.Bottom = static_cast< std::int16_t >( Baseline - i_rSheet.Glyphs.Descent() );
    New.Top = static_cast< std::int16_t >( Baseline + i_rSheet.Glyphs.Ascent() );
    io_rView.Candidates.push_back( New );
  }
  io_rView.Choice.Choose( io_rView.Candidates, i_rStyle.Limit, io_rContext.Viewport().size() );
}

namespace
{
/// True while it is not there.
bool Approach( float& io_rStrength, float i_Goal, float i_Step )
{
  io_rStrength = std::clamp( i_Goal, io_rStrength - i_Step, io_rStrength + i_Step );
  return io_rStrength != i_Goal;
}
} // namespace

/// After a choice: what is not to be seen is gone at once.
void VLabelBatch::Fade( VView& io_rView, float i_Step ) const
{
  io_rView.bUnsettled = false;
  io_rView.Shown.clear();
  std::size_t Next = 0;
  for ( const VLabelCandidate& rCandidate : io_rView.Candidates )
  {
    for ( ; Next < rCandidate.Label; ++Next )
    {
      io_rView.Strengths[Next] = 0; // out of sight
    }
    float& rStrength = io_rView.Strengths[Next++];
    const float Goal = rCandidate.bChosen ? rCandidate.Strength : 0.0F;
    io_rView.bUnsettled |= Approach( rStrength, Goal, i_Step );
    if ( rStrength > 0 )
    {
      io_rView.Shown.push_back( { rCandidate.Label, rCandidate.X, rCandidate.Y, Goal } );
    }
  }
  std::fill( io_rView.Strengths.begin() + static_cast< std::ptrdiff_t >( Next ), io_rView.Strengths.end(), 0.0F );
}

/// Between two choices: what is shown goes where its point is, and on with its fading.
void VLabelBatch::Follow( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
                          float i_Step ) const
{
  const VSight Sight( io_rContext, i_rSheet.Glyphs.Pixels() );
  std::size_t Kept = 0;
  for ( VView::VShown Shown : io_rView.Shown )
  {
    float& rStrength = io_rView.Strengths[Shown.Label];
    const VLabelPoint& rPoint = m_Points[Shown.Label];
    (void)Approach( rStrength, Shown.Goal, i_Step );
    if ( !rPoint.bShown || !Sight.See( rPoint, m_Traits[Shown.Label].bBeside, Shown.X, Shown.Y ) )
    {
      rStrength = 0;
    }
    if ( rStrength > 0 )
    {
      io_rView.Shown[Kept++] = Shown;
    }
  }
  io_rView.Shown.resize( Kept );
  io_rView.bUnsettled = true; // others may be due
}

bool VLabelBatch::Write( VView& io_rView, const VSheet& i_rSheet ) const
{
  std::size_t Count = 0;
  for ( const VView::VShown& rShown : io_rView.Shown )
  {
    Count += i_rSheet.Layouts[rShown.Label].Count;
  }
  auto* pInstance = static_cast< VPieceInstance* >( io_rView.Pieces.Map( Count * sizeof( VPieceInstance ) ) );
  if ( !pInstance )
  {
    return false;
  }
  for ( const VView::VShown& rShown : io_rView.Shown )
  {
    const VTextLayout& rLayout = i_rSheet.Layouts[rShown.Label];
    const VLabelText& rText = m_Texts[rShown.Label];
    const std::uint32_t Own = m_Points[rShown.Label].bMarked ? MarkedColour : rText.Colour;
    const auto Alpha = static_cast< std::uint32_t >( io_rView.Strengths[rShown.Label] * 255 );
    const int X = rShown.X + i_rSheet.OffsetX( rShown.Label, rText.Place );
    const int Y = rShown.Y - i_rSheet.OffsetY( rText.Place );
    const VPlacedGlyph* pPiece = i_rSheet.Glyphs.Glyphs( rLayout );
    for ( const VPlacedGlyph* const pEnd = pPiece + rLayout.Count; pPiece != pEnd; ++pPiece )
    {
      *pInstance++ = { { static_cast< std::int16_t >( X + pPiece->X ), static_cast< std::int16_t >( Y - pPiece->Y ),
                         pPiece->Width, pPiece->Height },
                       { pPiece->SheetX, pPiece->SheetY },
                       ( Own & 0xFFFFFF ) | Alpha << 24 };
    }
  }
  io_rView.Instances = static_cast< int >( Count );
  return io_rView.Pieces.Unmap();
}

/// Brings what the view shows up to now.
void VLabelBatch::Advance( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
                           const VLabelStyle& i_rStyle, bool i_bSettled ) const
{
  const VView::VKey Key{ m_TextsGeneration,
                         m_PointsGeneration,
                         m_MarksGeneration,
                         i_rSheet.Serial,
                         i_rStyle,
                         io_rContext.Viewport().size(),
                         io_rContext.ViewProjection() };
  const VView::VKey& rFormer = io_rView.Key;
  const double Now = m_Clock();
  if ( io_rView.bUnsettled || !( Key == rFormer ) )
  {
    const bool bAnew = Key.Texts != rFormer.Texts || Key.Sheet != rFormer.Sheet || !( Key.Style == rFormer.Style );
    const double Passed = Now - io_rView.Time;
    const bool bAtOnce = i_bSettled || bAnew || Passed < 0 || Passed > LongestPause;
    const bool bChoose = bAtOnce || Now - io_rView.ChosenAt >= ChoiceSeconds || Key.Marks != rFormer.Marks ||
                         Key.Viewport != rFormer.Viewport;
    const float Step = bAtOnce ? 1.0F : static_cast< float >( Passed ) / FadeSeconds;
    io_rView.Key = Key;
    io_rView.bWritten = false;
    if ( bAnew )
    {
      io_rView.Strengths.assign( m_Texts.size(), 0 );
    }
    if ( bChoose )
    {
      io_rView.ChosenAt = Now;
      Choose( io_rContext, io_rView, i_rSheet, i_rStyle );
      Fade( io_rView, Step );
    }
    else
    {
      Follow( io_rContext, io_rView, i_rSheet, Step );
    }
  }
  io_rView.Time = Now;
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
  Advance( io_rContext, rView, rSheet, i_rStyle, i_bSettled );
  if ( rView.Shown.empty() )
  {
    return;
  }
  // A second try is for a buffer that died with its windows.
  rView.bWritten = ( rView.bWritten && rView.Pieces.Bind() ) || Write( rView, rSheet );
  if ( !rView.bWritten || !rSheet.Glyphs.Bind( io_rContext, SheetUnit ) || !io_rContext.UseProgram( m_pGl->pProgram ) ||
       !io_rContext.SetVertexBuffer( { &rView.Pieces, &PieceLayout, 0 } ) )
  {
    return;
  }
  io_rContext.SetRenderState( m_pGl->State );
  m_pGl->Sheet.Set( *m_pGl->pProgram, SheetUnit );
  io_rContext.DrawArraysInstanced( GL_TRIANGLE_STRIP, 4, rView.Instances );
}

} // namespace MoxelGraphics
