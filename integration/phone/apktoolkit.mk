# For a product's makefile:
#   $(call inherit-product, external/apktoolkit/integration/phone/apktoolkit.mk)
# This also installs libzu: the product's own library or the stub (docs/porting.md).
PRODUCT_PACKAGES += \
    apktoolkit \
    apktoolkit-all \
    apktoolkit-bound \
    apktoolkit-verify
