#pragma once

// The attribute names of every scene schema, in declaration order: one list per schema,
// X(name) for each name (XK(name) for a name that is a C++ keyword). scene_schema.h makes
// the static accessors from them and scene_schema_table.cpp the run-time table.

// clang-format off
#define SCENE_SCHEMA_NAMES_SCENE(X, XK) \
  X(name) X(root) X(components) X(useLightGroups) X(environment) X(linearUnits) X(framesPerSecond) \
  X(snapOnFrames) X(loopAnimation) X(autoKey) X(resourcePaths) X(animLayers) X(time) X(startTime) X(endTime) \
  X(playSpeed) X(upAxis) X(showConsole) X(consoleVerbosity) X(logVerbosity)

#define SCENE_SCHEMA_NAMES_LIGHT(X, XK) \
  X(name) X(lightGroup) X(lightType) X(environmentPortal) X(color) X(texture) X(sunColor) X(intensity) \
  X(diffuseContrib) X(specularContrib) X(spotConeAngle) X(spotPenumbraAngle) X(spotShowCone) X(iesFile) \
  X(iesUseSize) X(visibleInCamera) X(visibleInReflections) X(visibleInIndirect) X(visibleInBloom) X(size) \
  X(sizeRatio) X(importance) X(shadows) X(customShadows) X(shadowColor) X(penumbraColor) X(shadowBlendMode) \
  X(caustics) X(shadowMapSize) X(shadowMapBias)

#define SCENE_SCHEMA_NAMES_BUFFER_ADAPTER(X, XK) \
  X(inputBuffer) X(inputOffset) X(inputLength) X(outputUint8) X(outputUint16) X(outputUint32) X(outputFloat) \
  X(outputFloat2) X(outputFloat3) X(outputFloat4)

#define SCENE_SCHEMA_NAMES_BUFFER(X, XK) \
  X(name) X(data) X(resourceId)

#define SCENE_SCHEMA_NAMES_TEXTURE(X, XK) \
  X(name) X(colorOffset) X(colorGain) X(colorContrast) X(colorSaturation) X(colorInvert) X(offsetInvert) \
  X(mapping) X(uvSet) X(wrapModeU) X(wrapModeV) X(borderColor) X(borderAlpha) X(mappingSide) X(translate) \
  X(scale) X(rotate) X(useImageAspect) X(worldSpace) X(keywords)

#define SCENE_SCHEMA_NAMES_BITMAP_TEXTURE(X, XK) \
  X(colorSpace) X(gamma) X(openColorIOFile) X(openColorIOSpace) X(colorChannels) X(filter) X(smoothing) \
  X(blurRadius) X(compression)

#define SCENE_SCHEMA_NAMES_RANDOM_TEXTURE(X, XK) \
  X(randomMode) X(texture) X(color) X(hue) X(saturation) X(value) X(seed)

#define SCENE_SCHEMA_NAMES_NOISE_TEXTURE(X, XK) \
  X(color1) X(color2) X(frequency) X(frequencyRatio) X(amplitude) X(amplitudeRatio) X(octaves) X(ridgeOffset)

#define SCENE_SCHEMA_NAMES_VERT_COLOR_TEXTURE(X, XK) \
  X(colorSetIndex) X(colorSetName)

#define SCENE_SCHEMA_NAMES_CELLULAR_TEXTURE(X, XK) \
  X(mode) X(coreColor) X(wallColor) X(factor)

#define SCENE_SCHEMA_NAMES_CHECKER_TEXTURE(X, XK) \
  X(evenColor) X(oddColor)

#define SCENE_SCHEMA_NAMES_EMBEDDED_TEXTURE(X, XK) \
  X(pixelData) X(alignment) X(width) X(height) X(depth) X(type) X(format)

#define SCENE_SCHEMA_NAMES_CURVATURE_TEXTURE(X, XK) \
  X(useCenterColor) X(concaveColor) X(centerColor) X(convexColor) X(curvatureScale) X(curvaturePower) \
  X(curvatureCutOff)

#define SCENE_SCHEMA_NAMES_FILE_TEXTURE(X, XK) \
  X(file) X(framesPerSecond) X(embeddedFile)

#define SCENE_SCHEMA_NAMES_CUBIST_TEXTURE(X, XK) \
  X(color1) X(color2) X(minimum) X(maximum)

#define SCENE_SCHEMA_NAMES_MATERIAL(X, XK) \
  X(name) X(inherit) X(smoothNormals) X(materialMask) X(bumpMap) X(bumpSpace) X(keywords)

#define SCENE_SCHEMA_NAMES_DOTS_TEXTURE(X, XK) \
  X(dotColor) X(backgroundColor) X(minimumRadius) X(maximumRadius) X(intensityVariation) X(shape)

#define SCENE_SCHEMA_NAMES_MIX_TEXTURE(X, XK) \
  X(mixMode) X(texture1) X(texture2) X(factor) X(factorTexture)

#define SCENE_SCHEMA_NAMES_PRINCIPAL_MATERIAL(X, XK) \
  X(model) X(color) X(reflectivity) X(reflectionAmount) X(anisotropy) X(anisotropyRotation) \
  X(anisotropyDirection) X(roughness) X(rimColor) X(rimAngle) X(emission) X(emissionAmount) \
  X(coatTransparency) X(coatReflectivity) X(coatRoughness) X(flakesScale) X(flakesIntensity) \
  X(flakesContrast) X(transparency) X(transparencyModel) X(thickness) X(scatterDistance) X(scatterAmount) \
  X(fogScatter) X(fogDistance) X(metalMap) X(colorMap) X(rimMap) X(reflectionAmountMap) X(roughnessMap) \
  X(anisotropyMap) X(anisotropyDirectionMap) X(coatRoughnessMap) X(coatAmountMap) X(emissionMap) \
  X(transparencyMap) X(visibilityMap) X(visibilityFromColorMap) X(ambientMap) X(ambientType) X(thicknessMap) \
  X(customMaterial) X(shaderOSL) X(shaderGLSL)

#define SCENE_SCHEMA_NAMES_HAIR_MATERIAL(X, XK) \
  X(colorTint) X(pigmentationColor) X(pigmentationAmount) X(roughnessAzimuthal) X(roughnessLongitudinal) \
  X(scalesAngle)

#define SCENE_SCHEMA_NAMES_TOON_MATERIAL(X, XK) \
  X(toonLevels) X(diffuseSmooth) X(color) X(shadowColor) X(rimMethod) X(rimColor) X(rimAngle) X(rimSmooth) \
  X(rimRotation) X(specularMethod) X(specularRotation) X(specularSmooth) X(specularColor) X(roughness) \
  X(anisotropy) X(anisotropyRotation) X(anisotropyDirection) X(emissionAmount) X(specularAmount) X(rimAmount) \
  X(colorMap) X(midtoneColorMap) X(shadowColorMap) X(reflectionAmountMap) X(roughnessMap) X(visibilityMap) \
  X(emissionMap)

#define SCENE_SCHEMA_NAMES_LIGHT_GROUP(X, XK) \
  X(name) X(lightTint) X(lightIntensity) X(enabled) XK(private)

#define SCENE_SCHEMA_NAMES_NODE(X, XK) \
  X(name) X(children) X(bounds) X(visible) X(animate) X(motionBlur) X(transformation) X(inheritsTransform) \
  X(translate) X(translatePivot) X(rotateMode) X(rotateOrder) X(rotate) X(rotateEuler) X(rotateAxisAngle) \
  X(rotatePivot) X(scale) X(scalePivot) X(shear) X(targetPosition) X(rotationAxes) X(distance) X(azimuth) \
  X(altitude) X(materialIndex) X(cameraIndex) X(geometryIndex) X(color) X(selectable) X(lock) X(isLayer) \
  X(isJoint)

#define SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL(X, XK) \
  X(curves) X(name) X(baked)

#define SCENE_SCHEMA_NAMES_ANIM_LAYER(X, XK) \
  X(actions) X(name) X(time) X(outputs) X(defaultValues)

#define SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL_CURVE(X, XK) \
  X(times) X(values) X(interpolation) X(preExtrapolation) X(postExtrapolation) X(tangents) X(weights) \
  X(tension) X(tightness)

#define SCENE_SCHEMA_NAMES_GEOMETRY(X, XK) \
  X(LOD) X(name) X(bounds) X(exactBounds) X(visible) X(visibleInCamera) X(visibleInReflections) \
  X(visibleInRefractions) X(visibleInDiffuse) X(visibleInCaustics) X(visibleInPhotons) X(visibleInOutline) \
  X(visibleInBloom) X(castShadows) X(receiveShadows) X(castOcclusion) X(receiveOcclusion) \
  X(receiveGlossyOcclusion) X(occlusionRadius) X(environmentPortal) X(treatAsLight) X(lightShadows) \
  X(lightCaustics) X(lightNormalize) X(flipNormals) X(spherizeNormals) X(offsetNormals) X(multiplyNormals) \
  X(sourceGeometry) X(renderGeometry) X(parentGeometry) X(instanceSlot)

#define SCENE_SCHEMA_NAMES_INSTANCER(X, XK) \
  X(name) X(bounds) X(objects) X(transforms) X(materialIndices)

#define SCENE_SCHEMA_NAMES_ANIM_LAYER_ACTION(X, XK) \
  X(animClip) X(playAt) X(playSpeed)

#define SCENE_SCHEMA_NAMES_ANIM_CLIP(X, XK) \
  X(name) X(keyframeChannels) X(startTime) X(endTime)

#define SCENE_SCHEMA_NAMES_GEOMETRY_L_O_D(X, XK) \
  X(geometry) X(distance)

#define SCENE_SCHEMA_NAMES_LINES(X, XK) \
  X(linesStart) X(points) X(velocities) X(colors) X(assignment) X(indicesDeltaCompression) X(materials)

#define SCENE_SCHEMA_NAMES_MESH_PRIMITIVE(X, XK) \
  X(name) X(materials) X(bounds) X(indexStart) X(indexCount) X(triIndexStart) X(triIndexCount) X(topology) \
  X(vcounts) X(ecounts) X(restartIndex) X(invisible)

#define SCENE_SCHEMA_NAMES_POINTS(X, XK) \
  X(points) X(velocities) X(IDs)

#define SCENE_SCHEMA_NAMES_HAIR(X, XK) \
  X(curvesStart) X(controlPoints) X(velocities) X(colors) X(indicesDeltaCompression) X(materials) \
  X(strandGeometry) X(strandShading) X(tessellation) X(widthMultiplier)

#define SCENE_SCHEMA_NAMES_FUR(X, XK) \
  X(density) X(knots) X(length) X(lengthVariation) X(thicknessRoot) X(thicknessTip) X(thicknessVariation) \
  X(bend) X(bendVariation) X(curls) X(curlRadius) X(curlRadiusVariation) X(material)

#define SCENE_SCHEMA_NAMES_MESH_JOINTS_SET(X, XK) \
  X(name) X(jointBounds) X(jointCounts) X(maxVertexJoints) X(indices) X(weights)

#define SCENE_SCHEMA_NAMES_MESH_BIND_POSE_SET(X, XK) \
  X(name) X(transforms)

#define SCENE_SCHEMA_NAMES_SUBDIVIDABLE(X, XK) \
  X(subdivide) X(displace) X(displaceMap) X(displaceSpace) X(displaceAmount) X(tessellation) \
  X(subdivideCorners) X(subdivideUVs) X(subdivideAdaptive)

#define SCENE_SCHEMA_NAMES_MESH_U_V_SET(X, XK) \
  X(name) X(UV) X(UVW) X(UVWQ) X(indices) X(invalidIndex)

#define SCENE_SCHEMA_NAMES_MESH(X, XK) \
  X(uvSets) X(colorSets) X(primitives) X(bindPoseSets) X(jointsSets) X(positions) X(normals) X(tangents) \
  X(bitangents) X(velocities) X(sharedVertexData) X(edgeVisibility) X(edgeSmooth) X(edgeBevel) \
  X(computeTangentsMethod) X(computeNormalsMethod) X(computeNormalsAngle) X(indicesDeltaCompression) \
  X(indices) X(triIndices) X(positionIndices) X(normalIndices) X(tangentIndices) X(edgeCreasesIndices) \
  X(vertexCreasesIndices) X(edgeCreasesWeights) X(vertexCreasesWeights)

#define SCENE_SCHEMA_NAMES_MESH_COLOR_SET(X, XK) \
  X(name) X(A) X(RGB) X(RGBA) X(indices) X(invalidIndex)

#define SCENE_SCHEMA_NAMES_SKIN(X, XK) \
  X(baseMesh) X(joints) X(bindPoseSetIndex) X(jointsSetIndex) X(outMesh)

#define SCENE_SCHEMA_NAMES_MORPH(X, XK) \
  X(targets) X(baseMesh) X(method) X(targetsWeight) X(blend) X(frame) X(outMesh) X(sphere) X(quad)

#define SCENE_SCHEMA_NAMES_ENVIRONMENT(X, XK) \
  X(name) X(environment) X(environmentMap) X(groundColor) X(zenithColor) X(horizonColor) X(sunGlowColor) \
  X(sunGlowSize) X(constantColor) X(skyTurbidity) X(intensity) X(sun) X(sunDateTime) X(sunLatitude) \
  X(sunLongitude) X(volumetricEffect) X(fogScatter) X(fogScatterFactor) X(fogTransparency) \
  X(fogTransparencyFactor) X(fogDistance) X(fogScaleFactor) X(fogStart) X(fogHeight) X(fogFalloff) \
  X(fogShadows) X(importance) X(shadows) X(caustics) X(visibleInReflections) X(visibleInBloom) X(background) \
  X(backgroundRotation) X(backgroundScale) X(backplateMap) X(backgroundFit) X(gradientStart) X(gradientEnd) \
  X(gradientBias) X(gradientSlope) X(groundPlane) X(groundHeight) X(matteGround) X(reflectivity) \
  X(reflectionAmount) X(roughness) X(transparency) X(color)

#define SCENE_SCHEMA_NAMES_STEREO_CAMERA(X, XK) \
  X(leftCamera) X(rightCamera) X(cameraSeparation)

#define SCENE_SCHEMA_NAMES_CAMERA(X, XK) \
  X(name) X(lensType) X(lensShift) X(orthographicZoom) X(focalLength) X(architect) X(aperture) \
  X(focusDistance) X(focusObject) X(apertureShape) X(apertureBias) X(apertureRotation) X(sensor) X(sensorFit) \
  X(cubemapType) X(sphericalAngle) X(motionBlur) X(shutter) X(shutterEfficiency) X(locked)

#define SCENE_SCHEMA_NAMES_MORPH_TARGET(X, XK) \
  X(targetMesh) X(weight) X(disk)

#define SCENE_SCHEMA_NAMES_CLIP_PLANE(X, XK) \
  X(name) X(enabled) X(normal) X(distance) X(cameraOnly) X(crossSection) X(material) X(faceOrientation) \
  X(outlineWidth) X(outlineColor) X(cube)

#define SCENE_SCHEMA_NAMES_COMPOSITING_CHANNEL(X, XK) \
  X(name) X(colorTint) X(filmExposure) X(highlightStrength) X(contrast) X(saturation) X(shadow) X(midtone) \
  X(highlight) X(midpoint)

#define SCENE_SCHEMA_NAMES_OUTPUT_JOB(X, XK) \
  X(name) X(enabled) X(outputType) X(stillFilename) X(stillFormat) X(stillResolution) X(animationFilename) \
  X(animationFormat) X(animationResolution) X(animationWholeRange) X(animationCustomRange) X(alpha) \
  X(comment) X(renderer) X(camera) X(sceneSet) X(combined) X(opacity) X(depth) X(normal) X(tangent) \
  X(velocity) X(uv) X(albedo) X(objectId) X(materialId) X(occlusion) X(outline) X(bloom) X(denoise) \
  X(emission) X(diffuse) X(indirect) X(reflection) X(refraction) X(fog) X(background) X(shadow) \
  X(lightGroups) X(material) X(integerIds)

#define SCENE_SCHEMA_NAMES_RENDER_OUTPUT(X, XK) \
  X(jobs) X(compositingChannels) X(name) X(activeJob) X(stereo) X(overwrite) X(placeholders) X(autoSave) \
  X(shutdownOnFinish) X(enablePost) X(savePost) X(tonemapping) X(openColorIOFile) X(openColorIOTransform) \
  X(gamma) X(filmExposure) X(highlightStrength) X(contrast) X(saturation) X(sharpen) X(sharpenClamp) \
  X(shadow) X(midtone) X(highlight) X(midpoint) X(whiteBalance) X(bloomRadius) X(bloomThreshold) \
  X(bloomStrength) X(bloomColor) X(vignetteScale) X(vignetteSoftness) X(enableCompositing) X(pngCompression) \
  X(pngColorDepth) X(jpgQuality) X(tiffCompression) X(tiffColorDepth) X(tiffCodec) X(exrColorDepth) \
  X(exrCodec) X(exrMultichannel) X(exrDeep)

#define SCENE_SCHEMA_NAMES_SCENE_REFERENCE(X, XK) \
  X(file) X(mode)

#define SCENE_SCHEMA_NAMES_WORKFLOW(X, XK) \
  X(history) X(job) X(status) X(urgency) X(client) X(assignee) X(assignNotes) X(approvedBy) X(approved) \
  X(trackVersions)

#define SCENE_SCHEMA_NAMES_METADATA(X, XK) \
  X(title) X(category) X(author) X(contactInfo) X(copyright) X(usageTerms) X(comment) X(keywords) X(source) \
  X(location) X(software) X(created) X(modified) X(rating)

#define SCENE_SCHEMA_NAMES_SCRIPT_OUTPUT(X, XK) \
  X(function) X(outputValue) X(script) X(outputs) X(file)

#define SCENE_SCHEMA_NAMES_HISTORY_EVENT(X, XK) \
  X(changes) X(date)

#define SCENE_SCHEMA_NAMES_SCENE_IMPORTER(X, XK) \
  X(keepInSync) X(importMeshes) X(importTriangulateMeshes) X(importSurfaces) X(importTriangulateSurfaces) \
  X(importSubdivision) X(importTessellation) X(importColors) X(importMultiIndex) X(importTextureCoordinates) \
  X(importNormals) X(computeNormalsMethod) X(computeNormalsAngle) X(flipNormals) X(importTangents) \
  X(computeTangentsMethod) X(importVelocities) X(importSkeletons) X(importEdges) X(importMaterials) \
  X(importLights) X(importCameras) X(importAnimations) X(importBakedAnimations) X(importHair) X(importPoints) \
  X(importFilename) X(modificationDate) X(hashMethod) X(compressionMethod) X(compressionLevel) \
  X(includeResources) X(textColumns)

#define SCENE_SCHEMA_NAMES_SCENE_EXPORTER(X, XK) \
  X(exportEdges) X(exportHair) X(exportPoints) X(exportColors) X(exportTextureCoordinates) X(exportTangents) \
  X(exportAnimations) X(exportCameras) X(exportLights) X(exportBinary) X(exportCompress) \
  X(exportCompressImages) X(exportImageMaxDim) X(exportEmbedded) X(exportCopyright) X(resourcePaths)

#define SCENE_SCHEMA_NAMES_VIEWPORT(X, XK) \
  X(name) X(renderer) X(camera) X(useViewportResolution) X(layout) X(separatorHorizontal) \
  X(separatorVertical) X(separatorHorizontalLock) X(separatorVerticalLock) X(syncSideViews) X(tool) \
  X(localMove) X(localRotate) X(snapMove) X(snapScale) X(snapRotate) X(editPivot) X(interactiveSnap) \
  X(snapAlignsToNormal) X(transformMode) X(snapDistance) X(showStatistics) X(showFPS) X(showMessages) \
  X(showProgress) X(textColor) X(lightsColor) X(showGrid) X(gridResolution) X(gridSize) X(gridColor) \
  X(showAxis) X(showCamera) X(showLights) X(showClipPlanes) X(showTextures) X(showPixelInfo) \
  X(cameraController) X(cameraRotateSpeed) X(cameraRotateFilter) X(cameraRotateFilterWeight) \
  X(cameraMoveAcceleration) X(cameraMoveMaxSpeed) X(cameraZoomSpeed)

#define SCENE_SCHEMA_NAMES_POPUP_WINDOW(X, XK) \
  X(detached) X(tab) X(position)

#define SCENE_SCHEMA_NAMES_VIEWPORT_WINDOW(X, XK) \
  X(popupWindows) X(name) X(visible) X(viewport) X(position) X(size) X(sidebarTab) X(sidebarPosition) \
  X(maximized) X(renderBoost) X(toolbarCollapsed) X(imageZoom) X(imageOffset)

#define SCENE_SCHEMA_NAMES_RENDERER(X, XK) \
  X(name) X(cpuUsage) X(tessellationModifier) X(overrideMaterial) X(overrideKeepTransparency) \
  X(overrideKeepNormals) X(textures) X(textureCompression) X(textureFilter) X(textureAnisotropy) \
  X(defaultLight) X(shadows) X(lights) X(motionBlur) X(fastBumpMapping) X(wireframe) X(wireframeWidth) \
  X(wireframeColor) X(outline) X(outlineMethod) X(outlineDepthWeight) X(outlineNormalWeight) \
  X(outlineThreshold) X(outlineStrength) X(outlineWidth) X(outlineColor) X(outlineHidden) \
  X(outlineHiddenStrength) X(selection) X(selectionColor) X(nogui) X(thumbnail)
// clang-format on
