import QtQuick
import Flow2Graphics 1.0

Item {
    id: root

    property CameraTile hoveredTile: null

    // What lies under the pointer, and of a small tile what it has no room for.
    function tip() {
        const tile = hoveredTile && !hoveredTile.complete ? hoveredTile.summary : ""
        return [sceneFBO.toolTipText, tile].filter(text => text !== "").join("<br>")
    }

    SceneFramebufferObject {
        id: sceneFBO

        objectName: "sceneFBO"
        anchors.fill: parent
        clip: true
        focus: true
        scene: contextFlowScene
        cameraGrid: contextCameraGrid

        Component.onCompleted: {
            const window = contextThemeWindow
            setOption("CameraView", true)
            setOption("3D", false)
            setOption("BackgroundColorRGB", (Math.round(window.r * 255) << 16)
                      | (Math.round(window.g * 255) << 8) | Math.round(window.b * 255))
        }
    }

    Repeater {
        model: contextCameraGrid

        CameraTile {
            objectName: "cameraTile"
            loaderCompact: contextCameraGrid.count > 6
            onHoveredChanged: {
                if (hovered)
                    root.hoveredTile = this
                else if (root.hoveredTile === this)
                    root.hoveredTile = null
            }
            Component.onDestruction: {
                if (root.hoveredTile === this)
                    root.hoveredTile = null
            }
        }
    }

    Text {
        objectName: "noCameras"
        anchors.centerIn: parent
        visible: contextCameraGrid !== null && contextCameraGrid.count === 0
        text: qsTr("No cameras")
        color: "#808489"
        font.pixelSize: 20
    }

    SceneContributions {
        anchors.right: parent.right
        anchors.bottom: parent.bottom
        anchors.margins: 16
        contributions: contextFlowScene ? contextFlowScene.contributions : null
        sceneItem: sceneFBO
        mostHeight: root.height / 2
        onCameraClicked: urn => contextFlowScene.SelectCamera(urn, false)
    }

    SceneToolTip {
        anchors.fill: parent
        text: root.tip()
        pointer: sceneFBO.mousePos
    }

    SceneNotice {
        anchors.horizontalCenter: parent.horizontalCenter
        anchors.bottom: parent.bottom
        anchors.bottomMargin: 24
        text: sceneFBO.notice
    }
}
