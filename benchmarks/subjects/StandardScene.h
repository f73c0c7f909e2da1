#pragma once

#include <CoreGraphics/VCameraController.h>
#include <Flow2Graphics/VFlowScene.h>
#include <MoxelGraphics/VSceneFrame.h>
#include <ZEK/FlowState.h>

#include <memory>
#include <vector>

namespace SubjectsBench
{

inline constexpr int Width = 1280;
inline constexpr int Height = 720;
inline constexpr int FrameCount = 60;

/// How much there is of what in the standard scene, for each step of its scale.
inline constexpr int CamerasPerScale = 128, ReconstructionsPerScale = 1000, SubjectsPerScale = 10;
inline constexpr int MarkersPerSubject = 53, SegmentsPerSubject = 20, SticksPerSubject = 60;

/// A point in the world, mm.
struct VPoint
{
  float X = 0, Y = 0, Z = 0;
};
/// The pose of a camera or of a segment: what its z axis points at is `Along`, of length 1.
struct VPlace
{
  VPoint Position, Along;
};

/// The numbers of the standard scene, as plain arrays: cameras on a ring, points and subjects that move in every frame.
struct VStandardData
{
  struct VFrame
  {
    std::vector< VPoint > Reconstructions;
    std::vector< VPoint > Markers;  ///< one subject after another
    std::vector< VPlace > Segments; ///< one subject after another
  };
  explicit VStandardData( int i_Scale );

  int Scale;
  std::vector< VPlace > Cameras;
  std::vector< float > HalfWidths;             ///< of what each camera sees 1000 mm away, mm; the height is 3/4 of it
  std::vector< std::uint32_t > SubjectColours; ///< 0xAABBGGRR
  std::vector< VFrame > Frames;
};

/// The rotation that takes the z axis the shortest way to a direction, row-major.
std::array< double, 9 > FromZ( const VPoint& i_rAlong );

/// The markers at both ends of a stick of a subject, as numbers of its own.
inline std::array< std::uint32_t, 2 > StickEnds( int i_Stick )
{
  return { static_cast< std::uint32_t >( i_Stick % MarkersPerSubject ),
           static_cast< std::uint32_t >( ( i_Stick * 7 + 3 ) % MarkersPerSubject ) };
}
inline constexpr std::uint32_t StickColours[2] = { 0xFF50C8FF, 0xFFFFC850 };
inline constexpr float ReconstructionRadius = 7, MarkerRadius = 9; // mm
inline float SegmentLength( int i_Segment )
{
  return 150.0F + 10.0F * static_cast< float >( i_Segment );
}

/// The same as frames of state: what a source would make of it, item by item. Cameras and what subjects are made of
/// are the same items in all states; points, labels and poses are new in each.
std::vector< ZEK::VFlowStateRef > MakeStates( const VStandardData& i_rData );

/// A scene that shows whichever of its states it is told to.
class VStandardScene : public Flow2Graphics::VFlowScene
{
public:
  VStandardScene( std::vector< ZEK::VFlowStateRef > i_States,
                  std::shared_ptr< ZEK::ISelectionService > i_pSelectionService )
    : VFlowScene( nullptr, std::move( i_pSelectionService ), nullptr, nullptr, false )
    , m_States( std::move( i_States ) )
  {
  }
  /// As a source does that has a new state, be it the same again.
  void Show( int i_Frame )
  {
    m_Newest = m_States[static_cast< std::size_t >( i_Frame % FrameCount )];
    MarkDirty();
  }
  const ZEK::IFlowState& Shown() const { return *m_Newest; }

protected:
  ZEK::VFlowStateRef FetchState() override { return m_Newest; }

private:
  std::vector< ZEK::VFlowStateRef > m_States;
  ZEK::VFlowStateRef m_Newest;
};

/// The one view of all figures: from (7000, -7000, 4500) to (0, 0, 800), 45 degrees of vertical field.
struct VStandardView
{
  explicit VStandardView( int i_Scale );

  std::shared_ptr< VStandardScene > pScene;
  MoxelGraphics::VSceneFrame Frame;
};

/// The view of that scale; made once, as its states take long to make.
VStandardView& StandardView( int i_Scale );

} // namespace SubjectsBench
