#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VSubjectCounts.h>

#include <array>
#include <memory>

namespace MoxelGraphics
{
class VMoxelScene;
struct VDisplayRecord;
struct VSubjectGroup;

/// The labelled markers of subjects as spheres, the sticks between them, and the targets where a model has its markers.
/// All subjects of a group are one draw a kind; what is not shown, and what did not change, is not looked at. Sticks
/// are round where that can be seen, else lines of one pixel.
class VRenderSubjectMarkers : public IRenderType
{
public:
  /// Which kind of subject a group holds, and with it whose display record it goes by.
  enum EGroup : std::size_t
  {
    ERigidObjects, ///< `PropSubject`
    ESubjects,     ///< `LabellingSubject`
    EProps,        ///< `PropSubject`
    ESolved,       ///< `SolvingSubject`
    GroupCount
  };
  using VGroups = std::array< const VSubjectGroup*, GroupCount >;

  /// The scene owns this object.
  explicit VRenderSubjectMarkers( VMoxelScene& i_rScene );
  ~VRenderSubjectMarkers() override;

  /// The groups must live as long as this object; null for one that there is not. Their lists are read in `Render`,
  /// each when its generation is another than at the last draw.
  void SetGroups( const VGroups& i_rGroups );
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// Thread: any.
  const VSubjectCounts& Counts( EGroup i_Group ) const { return m_Counts[i_Group]; }

  /// The display record that a group goes by.
  static const VDisplayRecord& Record( const VSceneOptions& i_rOptions, std::size_t i_Group );

private:
  struct VGl;
  struct VGroupDraw;
  void RenderGroup( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, std::size_t i_Group );
  // What is drawn of the kind; how many show.
  std::size_t RenderTargets( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                             VGroupDraw& io_rDraw );
  std::size_t RenderSticks( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                            VGroupDraw& io_rDraw, bool i_bDuringGaps );
  void DrawLines( CoreGraphics::VRenderContext& io_rContext, VGroupDraw& io_rDraw );
  void DrawRound( CoreGraphics::VRenderContext& io_rContext, VGroupDraw& io_rDraw );

  VMoxelScene& m_rScene;
  std::unique_ptr< VGl > m_pGl;
  std::array< std::unique_ptr< VGroupDraw >, GroupCount > m_Groups;
  std::array< VSubjectCounts, GroupCount > m_Counts;
};

} // namespace MoxelGraphics
