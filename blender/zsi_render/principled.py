# SPDX-License-Identifier: Apache-2.0
"""Blender's surface nodes as shader classes, by the rules of glTF's metallic-roughness materials: what
is metal becomes corvid_Mtl_Metal, what light passes through corvid_Mtl_Dielectric, the rest
corvid_Mtl_MetallicPaint without flakes. A material is one of them: what is half metal is what it is
more. Widths of lobes are roughness squared, once, as in Blender's own GGX lobes."""

from .nodes import Reader

_NARROWEST, _WIDEST_COAT = 0.001, 0.5
_IDENTITY = [[1, 0, 0], [0, 1, 0], [0, 0, 1]]


def reflectance(ior):
    """At normal incidence."""
    return ((ior - 1.0) / (ior + 1.0)) ** 2


def _width(roughness):
    return max(roughness**2, _NARROWEST)


def paint(color, coat, width):
    """Parameters of the paint without flakes: a diffuse base under a coat."""
    return {
        "u_baseColor": color,
        "u_baseRoughValue": 0.0,
        "u_flakeDensity": 0.0,
        "u_pearlColor": [1.0, 1.0, 1.0, 0.0],
        "u_coatReflectivity": coat,
        "u_coatRoughValue": min(max(width, _NARROWEST), _WIDEST_COAT),
    }


def matt(color):
    """A surface that scatters alike in all directions; the paint's coat mirrors at grazing angles
    whatever its reflectance."""
    return {
        "class": "corvid_Mtl_Ward",
        "parameters": {
            "u_diffuseColor": color,
            "u_reflectivity": 0.0,
            "u_additionalColor": [0.0] * 3,
        },
    }


def metal(color, width):
    return {
        "class": "corvid_Mtl_Metal",
        "parameters": {
            "u_reflectColor": color,
            "u_edgeColor": [1.0, 1.0, 1.0],
            "u_roughValue": max(width, _NARROWEST),
        },
    }


def _map(parameters, prefix, texture, images):
    """A colour from a picture: prefixMap and what belongs to it."""
    parameters[f"{prefix}MapEnable"] = True
    parameters[f"{prefix}Map"] = images.picture(texture.image)
    parameters[f"{prefix}Transform"] = texture.transform


def _rough_map(parameters, prefix, texture, images, factor=1.0):
    parameters[f"{prefix}MapEnable"] = True
    parameters[f"{prefix}Map"] = images.squared(texture.image, texture.channel, factor)
    parameters[f"{prefix}Transform"] = texture.transform


def _number(value, images):
    """Of an input that decides between classes: a picture counts by its mean."""
    if value.texture:
        texture = value.texture
        return images.mean(texture.image, 3 if texture.is_alpha else texture.channel)
    return value.value


def _cut_out(entry, alpha, images, note):
    """Alpha as a mask."""
    parameters = entry["parameters"]
    if alpha.texture:
        if entry["class"] == "corvid_Mtl_Metal" and not alpha.texture.is_alpha:
            _map(parameters, "u_cutout", alpha.texture, images)
            return
        parameters |= {
            "maskingMode": 1,
            "maskingTexture": images.picture(alpha.texture.image),
            "maskingUVMatrix": alpha.texture.transform,
            "maskingFromAlpha": alpha.texture.is_alpha,
            "maskingInvertTexture": True,  # the mask says what goes, alpha what stays
        }
    elif alpha.value < 1.0:
        parameters |= {"maskingMode": 0, "maskingColor": [1.0 - alpha.value] * 3}


def _emission(read, note):
    """Colour times strength; black without."""
    color = read("Emission Color", "Emission", "Color", default=[0.0] * 3)
    strength = read("Emission Strength", "Strength", default=1.0)
    if strength.texture:
        note("the picture of its emission's strength is left out")
    return color, strength.value


def _principled(node, images, note):
    read = Reader(node, note)
    color, roughness, alpha = read("Base Color"), read("Roughness"), read("Alpha", default=1.0)
    metallic = _number(read("Metallic"), images)
    transmission = _number(read("Transmission Weight", "Transmission"), images)
    bump = read.height()
    for what, share in (("metallic", metallic), ("transmission", transmission)):
        if 0.05 < share < 0.95:
            note(f"is {share:.0%} {what}; that is taken as {'all' if share >= 0.5 else 'nothing'}")
    left_out = ("Sheen Weight", "Sheen"), ("Subsurface Weight", "Subsurface")
    for names in left_out:
        if _number(read(*names), images) > 0.0:
            note(f"its {names[-1].lower()} is left out")
    glow, strength = _emission(read, note)
    if strength > 0.0 and (glow.texture or any(glow.value)):
        entry = _glowing(read, color, roughness, glow, strength, images, note)
    elif metallic >= 0.5:
        entry = _metal(read, color, roughness, images, note)
    elif transmission >= 0.5:
        entry = _glass(read, color, roughness, images, note)
    else:
        entry = _paint(read, color, roughness, images, note)
    _cut_out(entry, alpha, images, note)
    if bump:
        _bump(entry, bump, images, note)
    return entry


def _metal(read, color, roughness, images, note):
    entry = metal(color.value, _width(roughness.value))
    parameters = entry["parameters"]
    if color.texture:
        _map(parameters, "u_reflect", color.texture, images)
    stretch = 1.0 - 0.9 * _number(read("Anisotropic"), images)  # width across over width along
    if stretch < 1.0:
        parameters["u_anisotropyValue"] = max(stretch, 0.1)
        parameters["u_roughValue"] = min(parameters["u_roughValue"] / stretch**0.5, 1.0)
        turn = _number(read("Anisotropic Rotation"), images)
        parameters["u_anisoRotationValue"] = ((turn + 0.5) % 1.0 - 0.5) * 6.2831853
    if roughness.texture:
        _rough_map(parameters, "u_rough", roughness.texture, images, stretch**-0.25)
    if _number(read("Coat Weight", "Clearcoat"), images) > 0.0:
        note("its clear coat is left out; metal has none")
    return entry


def _glass(read, color, roughness, images, note):
    ior = max(read("IOR", default=1.45).value, 1.0)
    further = read("Transmission Roughness").value  # until Blender 4.0
    parameters = {
        "u_ior": ior,
        "u_reflectance": reflectance(ior),
        "u_refractColor": color.value,
        "u_roughValue": _width(1.0 - (1.0 - roughness.value) * (1.0 - further)),
    }
    if color.texture:
        note("the picture of its base colour is left out; glass has one tint")
    if roughness.texture:
        _rough_map(parameters, "u_rough", roughness.texture, images)
    return {"class": "corvid_Mtl_Dielectric", "parameters": parameters}


def _coat(read, images):
    """Reflectance at normal incidence: until Blender 4.0 of the specular value alone."""
    if read.socket("Specular IOR Level"):
        return reflectance(read("IOR", default=1.5).value) * 2.0 * read("Specular IOR Level").value
    return 0.08 * _number(read("Specular", default=0.5), images)


def _paint(read, color, roughness, images, note):
    coat = _number(read("Coat Weight", "Clearcoat"), images)
    if coat > 0.0:
        # The coat is what is seen; below it the surface's own highlight is dull by comparison.
        ior = read("Coat IOR", default=1.5).value
        smooth = read("Coat Roughness", "Clearcoat Roughness")
        parameters = paint(color.value, coat * reflectance(ior), _width(smooth.value))
        if smooth.texture:
            _rough_map(parameters, "u_coatRough", smooth.texture, images)
        note("under its clear coat the surface has no highlight of its own")
    else:
        reflected = _coat(read, images)
        if reflected == 0.0:
            entry = matt(color.value)
            if color.texture:
                _map(entry["parameters"], "u_diffuse", color.texture, images)
            return entry
        parameters = paint(color.value, reflected, _width(roughness.value))
        if roughness.texture:
            _rough_map(parameters, "u_coatRough", roughness.texture, images)
    if color.texture:
        _map(parameters, "u_base", color.texture, images)
    return {"class": "corvid_Mtl_MetallicPaint", "parameters": parameters}


def _glowing(read, color, roughness, glow, strength, images, note):
    """The Ward class alone adds light of its own."""
    parameters = {
        "u_diffuseColor": color.value,
        "u_roughValue": _width(roughness.value),
        "u_reflectGlossyValue": min(roughness.value**2, 1.0),
        "u_brdf00Reflectivity": _coat(read, images),
        "u_brdf90Reflectivity": 1.0 if _coat(read, images) > 0.0 else 0.0,
        "u_brdfCurvePower": 5.0,
        "u_additionalColor": [strength * c for c in glow.value],
    }
    if color.texture:
        _map(parameters, "u_diffuse", color.texture, images)
    if roughness.texture:
        note("the picture of its roughness is left out beside emission")
    if glow.texture:
        parameters["u_additionalColor"] = [strength] * 3
        parameters["u_additionalMapEnable"] = True
        parameters["u_additionalMap"] = images.picture(glow.texture.image)
        parameters["u_additionalMapTransform"] = glow.texture.transform
    return {"class": "corvid_Mtl_Ward", "parameters": parameters}


def _bump(entry, bump, images, note):
    """Classes with heights from a picture; the three channels of theirs add up."""
    prefix = {"corvid_Mtl_Metal": "u_pattern", "corvid_Mtl_MetallicPaint": None}.get(
        entry["class"], "u_normal0"
    )
    if prefix is None:
        note("its bump is left out; paint has none")
        return
    texture, depth = bump
    parameters = entry["parameters"]
    parameters["u_patternEnable" if prefix == "u_pattern" else f"{prefix}MapEnable"] = True
    parameters[f"{prefix}Map"] = images.picture(texture.image)
    parameters[f"{prefix}Transform"] = texture.transform
    parameters[f"{prefix}Amount"] = depth / 3.0


def _diffuse(node, images, note):
    read = Reader(node, note)
    color, bump = read("Color"), read.height()
    if read("Roughness").value > 0.0:
        note("its roughness is left out")
    entry = matt(color.value)
    if color.texture:
        _map(entry["parameters"], "u_diffuse", color.texture, images)
    if bump:
        _bump(entry, bump, images, note)
    return entry


def _glossy(node, images, note):
    read = Reader(node, note)
    return _metal(read, read("Color"), read("Roughness"), images, note)


def _glass_node(node, images, note):
    read = Reader(node, note)
    return _glass(read, read("Color"), read("Roughness"), images, note)


def _emission_node(node, images, note):
    read = Reader(node, note)
    glow, strength = _emission(read, note)
    parameters = {
        "u_diffuseColor": [0.0] * 3,
        "u_reflectivity": 0.0,
        "u_additionalColor": [strength * c for c in glow.value],
    }
    if glow.texture:
        parameters["u_additionalColor"] = [strength] * 3
        parameters["u_additionalMapEnable"] = True
        parameters["u_additionalMap"] = images.picture(glow.texture.image)
        parameters["u_additionalMapTransform"] = glow.texture.transform
    return {"class": "corvid_Mtl_Ward", "parameters": parameters}


KINDS = {
    "BSDF_PRINCIPLED": _principled,
    "BSDF_DIFFUSE": _diffuse,
    "BSDF_GLOSSY": _glossy,
    "BSDF_ANISOTROPIC": _glossy,
    "BSDF_GLASS": _glass_node,
    "EMISSION": _emission_node,
}
