# For a product's makefile:
#   $(call inherit-product, external/apktoolkit/integration/phone/apktoolkit.mk)
# This brings libzu, too: the product's own or the stub (docs/porting.md).
PRODUCT_PACKAGES += \
    apktoolkit \
    apktoolkit-all \
    apktoolkit-bound \
    apktoolkit-verify
