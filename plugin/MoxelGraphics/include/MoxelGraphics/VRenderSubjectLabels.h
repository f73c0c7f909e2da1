#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VLabelBatch.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <array>
#include <cstdint>
#include <vector>

namespace MoxelGraphics
{
class VMoxelScene;
struct VDisplayRecord;

/// The names of subjects, above the highest of their markers or bones, those of other things that the scene has labels
/// for, and on request those of markers. One of several groups that know a subject of the same name shows it.
class VRenderSubjectLabels : public IRenderType
{
public:
  static constexpr std::size_t GroupCount = 6;
  using VGroups = std::array< const VSubjectGroup*, GroupCount >;

  /// The scene owns this object.
  explicit VRenderSubjectLabels( VMoxelScene& i_rScene );
  ~VRenderSubjectLabels() override;

  /// Rigid object, subject, prop, solving, retargeting, scene mesh; any may be null. They outlive this object's last
  /// draw.
  void SetGroups( const VGroups& i_rGroups );

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  VLabelBatch& Labels() { return m_Labels; }

private:
  /// What the labels were made from.
  struct VSeen
  {
    std::array< std::uint64_t, GroupCount > Structure{}, Markers{}, Poses{}, Records{}, MarkerIds{};
    bool bMarkerNames = false; ///< a view asked for them
    bool bYUp = false;
    std::uint64_t Updates = 0;
    friend bool operator==( const VSeen&, const VSeen& ) = default;
  };
  /// The label of a subject; those of its markers, if there are any, follow it.
  struct VNamed
  {
    std::uint32_t Group = 0, Record = 0, Label = 0;
  };

  VSeen Look( const VSceneOptions& i_rOptions ) const;
  bool TextsDiffer( const VSeen& i_rNew ) const;
  bool TakeSceneLabels();
  void MakeTexts();
  void AddSubject( std::size_t i_Group, std::size_t i_Record, std::vector< VLabelText >& io_rTexts );
  void Place();
  void PlaceSubject( const VNamed& i_rNamed );
  void PlaceMarkers( const VNamed& i_rNamed );
  void Mark( VLabelPoint& o_rPoint, bool i_bOn );

  VMoxelScene& m_rScene;
  VGroups m_Groups{};
  VLabelBatch m_Labels;
  VSeen m_Seen;
  bool m_bMade = false;
  bool m_bMarksDiffer = false;
  std::vector< VNamed > m_Named;
  std::vector< const struct VSceneLabel* > m_SceneLabels; ///< the scene's own, good until its next update
  std::vector< std::string > m_SceneTexts;
};

} // namespace MoxelGraphics
