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

/// What is known of the bodies of subjects: bones, joints, axes and origins, the wires from a bone to its markers, how
/// sure the model is of its markers, markers that were not seen, and skins. All subjects of a group are one draw a
/// kind, skins apart; what is not shown, and what did not change, is not looked at.
class VRenderSubjectDynamics : public IRenderType
{
public:
  /// Which kind of subject a group holds, and with it whose display record it goes by.
  enum EGroup : std::size_t
  {
    ERigidObjects, ///< `PropSubject`
    ESubjects,     ///< `LabellingSubject`
    EProps,        ///< `PropSubject`
    ESolved,       ///< `SolvingSubject`
    ERetargeted,   ///< `RetargetingSubject`
    ESceneMeshes,  ///< `SceneMesh`
    GroupCount
  };
  using VGroups = std::array< const VSubjectGroup*, GroupCount >;

  /// The scene owns this object.
  explicit VRenderSubjectDynamics( VMoxelScene& i_rScene );
  ~VRenderSubjectDynamics() override;

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
  struct VPass;
  void RenderSeen( const VPass& i_rPass );
  void RenderIds( const VPass& i_rPass );
  void RenderSkins( const VPass& i_rPass );
  std::size_t DrawBones( const VPass& i_rPass, bool i_bTranslucent );
  std::size_t DrawWires( const VPass& i_rPass );
  void TakeBoneMesh();

  VMoxelScene& m_rScene;
  std::unique_ptr< VGl > m_pGl;
  std::array< std::unique_ptr< VGroupDraw >, GroupCount > m_Groups;
  std::array< VSubjectCounts, GroupCount > m_Counts;
};

} // namespace MoxelGraphics
