#pragma once

#include <Flow2Graphics/IFlowRenderType.h>

#include <MoxelGraphics/VRenderMarkerTrails.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <array>
#include <cstdint>
#include <memory>
#include <vector>

namespace Flow2Graphics
{

class VFlowScene;
class VTrailHistory;
struct VTrailItems;

/// Trails of markers, to both sides of the present: of all, or of those that are selected when some are. What a frame
/// does not know yet it asks of the scene, a bounded stretch of time at once, so that long trails grow over some
/// frames; live there is no future to be known. A time that goes back or jumps begins anew, and where a marker was not
/// seen its trail is broken.
///
/// Cost: while trails are off, three look-ups a state.
class VFlowRenderMarkerTrails : public MoxelGraphics::VRenderMarkerTrails, public IFlowRenderType
{
public:
  /// Groups whose markers have colours; any may be null.
  using VGroups = std::array< const MoxelGraphics::VSubjectGroup*, 2 >;

  /// The scene owns this object.
  explicit VFlowRenderMarkerTrails( VFlowScene& i_rScene );
  ~VFlowRenderMarkerTrails() override;

  void SetGroups( const VGroups& i_rGroups ) { m_Groups = i_rGroups; }
  void Update( const ZEK::IFlowState& i_rState ) override;

protected:
  bool FillTrails( const MoxelGraphics::VSceneOptions& i_rOptions ) override;

private:
  /// What the points were made from.
  struct VMade
  {
    std::int64_t Now = 0, Past = 0, Future = 0;
    std::size_t Frames = 0;
    std::uint64_t States = 0, Marks = 0;
    std::array< std::uint64_t, 2 > Structure{};
    friend bool operator==( const VMade&, const VMade& ) = default;
  };

  void Follow();
  void Fetch( std::int64_t i_First, std::int64_t i_Last );
  void FetchMissing( std::int64_t i_Past, std::int64_t i_Future );
  void MarkChosen();
  std::uint32_t ColourOf( std::size_t i_Marker ) const;
  void MakePoints( const VMade& i_rMade );
  void AddTrail( std::size_t i_Marker, const VMade& i_rMade, std::int64_t i_Step );

  VFlowScene& m_rFlowScene;
  VGroups m_Groups{};
  std::unique_ptr< VTrailHistory > m_pHistory;
  std::unique_ptr< VTrailItems > m_pItems; ///< of the newest state
  ZEK::VFlowTimeKey m_Key;
  std::uint64_t m_States = 0;   ///< that came, 0: none yet
  std::uint64_t m_Followed = 0; ///< the one that the history holds as the present
  ZEK::VFlowTimeKey m_FollowedKey;
  std::unique_ptr< VTrailItems > m_pFollowed;
  std::int64_t m_KnownFrom = 0;   ///< ticks; from here to the present all was asked for
  std::uint64_t m_Looks = 0;      ///< of the scene, when it was asked last
  std::int64_t m_FutureAsked = 0; ///< up to which the future was asked for, in the present state
  std::array< std::int64_t, 2 > m_Wanted{}, m_WantedBefore{}; ///< ticks of past and future, the most of any view, at
                                                              ///< this state and at the one before
  std::vector< ZEK::VFlowStateRef > m_Fetched;
  std::vector< std::uint8_t > m_Chosen; ///< by marker; empty: all
  VMade m_Made;
};

} // namespace Flow2Graphics
