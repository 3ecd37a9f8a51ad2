# For a product's makefile:
#   $(call inherit-product, external/apktoolkit/integration/phone/apktoolkit.mk)
# libzu comes along, as the product's own or as the stub (docs/porting.md).
PRODUCT_PACKAGES += \
    apktoolkit \
    apktoolkit-all \
    apktoolkit-bound \
    apktoolkit-verify
