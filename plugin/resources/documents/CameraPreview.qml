import QtQuick
import Flow2Graphics 1.0

// What one camera of the scene sees, over a corner of the 3D view.
Item {
    id: root

    property string camera
    property size available
    property bool maximised: false
    readonly property real wanted: maximised ? available.height - 100 : available.height * 0.3

    signal closed()

    component Tool: Rectangle {
        id: tool

        property string text

        signal clicked()

        width: 20
        height: 20
        radius: 4
        color: area.containsMouse ? "#C0303438" : "#80101214"

        Text {
            anchors.centerIn: parent
            text: tool.text
            color: "#DCDEE2"
            font.pixelSize: 12
        }

        MouseArea {
            id: area

            anchors.fill: parent
            hoverEnabled: true
            onClicked: tool.clicked()
        }
    }

    height: Math.max(0, Math.min(wanted, (available.width - 100) / contextCameraGrid.aspectRatio))
    width: height * contextCameraGrid.aspectRatio

    Behavior on height {
        NumberAnimation { duration: 250; easing.type: Easing.OutCubic }
    }

    SceneFramebufferObject {
        objectName: "previewFBO"
        anchors.fill: parent
        scene: contextFlowScene
        cameraGrid: contextCameraGrid
        previewCamera: root.camera

        Component.onCompleted: {
            setOption("CameraView", true)
            setOption("Distort3D", true)
        }
    }

    Rectangle {
        anchors.fill: parent
        color: "transparent"
        border.color: "#60FFFFFF"
    }

    Row {
        anchors.right: parent.right
        anchors.top: parent.top
        anchors.margins: 6
        spacing: 4

        Tool {
            text: root.maximised ? "–" : "+"
            onClicked: root.maximised = !root.maximised
        }

        Tool {
            text: "×"
            onClicked: root.closed()
        }
    }
}
