#pragma once

// Many short texts in the picture, each beside or above a point of the world, in one draw.
//
// A text is laid out once for each size that a view asks for, and lies in one texture, drawn at the very pixels of that
// size, so that it is as crisp as any other text on that screen. A frame in which something moved writes one rectangle
// a label that is shown, any other frame nothing. Which labels are shown is chosen for each view: the nearest, as many
// as the limit allows, that do not cover one another. That is not done in each frame: while things move it is every
// fifth of a second, and in between what is shown moves along and what is gone goes. What is no longer chosen fades out
// and what is chosen anew fades in, so that nothing flickers while two change places; the first frame of a view, and
// the first after something was set otherwise, shows the final state at once.

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;
class VResources;
} // namespace CoreGraphics

namespace MoxelGraphics
{

/// Where a text stands to its point.
enum class ELabelPlace : std::uint8_t
{
  Above, ///< in the middle over it
  Beside ///< to its right
};

/// What a label says and how it looks: structure.
struct VLabelText
{
  std::string Text;                  ///< UTF-8 of any script, shortened where it is too long; empty: never shown
  std::uint32_t Colour = 0xFFFFFFFF; ///< 0xAABBGGRR
  ELabelPlace Place = ELabelPlace::Beside;
  bool bName = false;            ///< stands before all that are none, however near those are, and is drawn bold
  std::uint32_t Needs = 0;       ///< bits of `VLabelStyle::Switches` that must all be on
  std::int32_t Unless = -1;      ///< a label: where that one has a place, this one is not shown
  std::uint32_t UnlessNeeds = 0; ///< provided that these switches are on
};

/// Where a label's point is: motion.
struct VLabelPoint
{
  float X = 0, Y = 0, Z = 0; ///< mm; not finite: not shown
  float Radius = 0;          ///< mm that a text beside it keeps off
  bool bShown = true;        ///< it has a place
  bool bMarked = false;      ///< shown in the colour of what is selected, before the others
};

struct VLabelStyle
{
  int Pixels = 13;    ///< height of the texts in item pixels
  float Distance = 0; ///< mm from the eye at which labels are gone; 0: none. Views without perspective have no distance
  int Limit = 60;     ///< labels at a time
  std::uint32_t Switches = 0; ///< what the view shows; the bits are the user's own
  friend bool operator==( const VLabelStyle&, const VLabelStyle& ) = default;
};

/// Thread: render thread, with the view's context current in `Draw`.
class VLabelBatch
{
public:
  explicit VLabelBatch( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VLabelBatch();

  void SetTexts( std::vector< VLabelText > i_Texts );
  std::size_t Count() const { return m_Texts.size(); }
  const std::vector< VLabelText >& Texts() const { return m_Texts; }
  /// One a text, to be written; whoever wrote calls `Moved`.
  std::span< VLabelPoint > Points() { return m_Points; }
  /// Whether some are marked that were not, or no longer.
  void Moved( bool i_bMarks = false )
  {
    ++m_PointsGeneration;
    m_MarksGeneration += i_bMarks ? 1 : 0;
  }

  /// Draws into the overlay pass of a view. `i_bSettled`: without fades.
  void Draw( CoreGraphics::VRenderContext& io_rContext, const VLabelStyle& i_rStyle, bool i_bSettled = false );

  /// The seconds that fades go by; a steady clock at first.
  void SetClock( std::function< double() > i_Clock ) { m_Clock = std::move( i_Clock ); }
  /// 0 to 1: how much of each label the view's last draw showed.
  std::vector< float > Strengths( CoreGraphics::VRenderContext& io_rContext ) const;
  /// How often a text was laid out so far.
  std::uint64_t LaidOut() const;

private:
  struct VView;
  struct VSheet;
  struct VGl;
  /// What a choice asks of a text.
  struct VTrait
  {
    std::uint32_t Needs = 0;
    std::int32_t Unless = -1;
    std::uint32_t UnlessNeeds = 0;
    bool bName = false, bBeside = false;
  };

  VView& ViewOf( CoreGraphics::VRenderContext& io_rContext ) const;
  VSheet& SheetOf( int i_Pixels );
  void Advance( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
                const VLabelStyle& i_rStyle, bool i_bSettled ) const;
  void Choose( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet,
               const VLabelStyle& i_rStyle ) const;
  bool IsWanted( std::size_t i_Label, std::uint32_t i_Switches ) const;
  void Fade( VView& io_rView, float i_Step ) const;
  void Follow( CoreGraphics::VRenderContext& io_rContext, VView& io_rView, const VSheet& i_rSheet, float i_Step ) const;
  bool Write( VView& io_rView, const VSheet& i_rSheet ) const;

  std::vector< VLabelText > m_Texts;
  std::vector< VTrait > m_Traits; ///< by text
  std::vector< VLabelPoint > m_Points;
  std::uint64_t m_TextsGeneration = 1, m_PointsGeneration = 1, m_MarksGeneration = 1, m_SheetSerial = 0;
  std::function< double() > m_Clock;
  std::unique_ptr< VGl > m_pGl;
  std::vector< std::unique_ptr< VSheet > > m_Sheets; ///< of the sizes in use, the one drawn last in front
};

} // namespace MoxelGraphics
