.class public Lcom/example/vault/Vault;
.super Ljava/lang/Object;

.method static constructor <clinit>()V
  .registers 1
  const-string v0, "vault"
  invoke-static {v0}, Ljava/lang/System;->loadLibrary(Ljava/lang/String;)V
  return-void
.end method

.method public static native open(I)I
.end method
