# For a product's makefile:
#   $(call inherit-product, external/apktoolkit/integration/phone/apktoolkit.mk)
# The build also installs libzu, because apktoolkit links it. The library is the product's own or
# the stub (docs/porting.md).
PRODUCT_PACKAGES += \
    apktoolkit \
    apktoolkit-all \
    apktoolkit-bound \
    apktoolkit-verify
